// The allocation failure switch.
#include "platform/allocation.h"

#include <atomic>
#include <cerrno>

static std::atomic<int> allocationFailsAt{0};   // allocations left until the injected failure; 0 = none

void failAllocation(int n) { allocationFailsAt = n > 0 ? n : 0; }

bool allocationAllowed() {
    int left = allocationFailsAt.load();
    while (left > 0) {
        if (allocationFailsAt.compare_exchange_weak(left, left - 1)) {
            if (left != 1) return true;
            errno = ENOMEM;
            return false;
        }
    }
    return true;
}
