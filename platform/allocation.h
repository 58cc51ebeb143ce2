#pragma once
// Allocations the engine survives failing. Where a buffer cannot be had the user gets a
// message, not a crash, so every growing allocation goes through these helpers: they turn a
// failure (std::bad_alloc, or a size beyond what a vector can hold) into false. Tests make the
// Nth allocation from now fail, as they make file calls fail (platform/files.h).

#include <cstddef>
#include <new>
#include <stdexcept>
#include <vector>

// "May I allocate": false when this is the allocation a test asked to fail (errno then reads
// ENOMEM); true otherwise. Every helper below asks it once; code that allocates otherwise
// (new (std::nothrow), calloc) asks it before.
bool allocationAllowed();

// Runs allocate (a callable that grows or copies containers) when an allocation is allowed;
// true when it ran without running out of memory. What allocate does before it throws is
// undone only as far as the containers' own guarantees go.
template <class Allocate>
bool tryAllocate(Allocate&& allocate) {
    if (!allocationAllowed()) return false;
    try {
        allocate();
    } catch (const std::bad_alloc&) {
        return false;
    } catch (const std::length_error&) {
        return false;
    }
    return true;
}

// v.resize(count) (new elements value-initialised, or copies of value); false when the memory
// cannot be had, and v is left as it was.
template <class T>
bool tryResize(std::vector<T>& v, size_t count) {
    return tryAllocate([&] { v.resize(count); });
}
template <class T>
bool tryResize(std::vector<T>& v, size_t count, const T& value) {
    return tryAllocate([&] { v.resize(count, value); });
}

// Failure injection for tests: the nth allocation from now fails (1 = the next one); 0 switches
// it off.
void failAllocation(int n);
