// The vector table: the aligned addresses handed out and the raw allocations behind them,
// grown by 16 entries at a time and released when the last vector goes.
#include "analysis/vector/vectorTable.h"

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <mutex>

#include "analysis/vector/vectorErrors.h"

VectorTable vectorTable;

// The table's lock lives as long as the process rather than being created with the first
// vector and deleted with the last: a thread waiting on a lock that another thread deletes
// would wait on freed memory.
static std::mutex vectorTableLock;

static const char* const NOT_ENOUGH_MEMORY = "(1) %s: Not enough memory.\n";

// Grows both address arrays to newCapacity entries; 0 when either allocation fails, with
// the table as it was.
static int growVectorTable(int newCapacity) {
    size_t bytes = size_t(newCapacity) * sizeof(void*);
    void** aligned = static_cast<void**>(std::realloc(vectorTable.alignedAddresses, bytes));
    if (!aligned) return 0;
    vectorTable.alignedAddresses = aligned;
    void** raw = static_cast<void**>(std::realloc(vectorTable.rawAddresses, bytes));
    if (!raw) return 0;
    vectorTable.rawAddresses = raw;
    vectorTable.capacity = newCapacity;
    return 1;
}

void* V_vector(size_t n, size_t size) {
    std::unique_lock<std::mutex> guard(vectorTableLock);
    if (vectorTable.count == vectorTable.capacity) {
        int newCapacity = vectorTable.capacity == 0 ? VECTOR_TABLE_FIRST_CAPACITY
                                                    : vectorTable.capacity + VECTOR_TABLE_GROWTH;
        if (!growVectorTable(newCapacity)) {
            guard.unlock();
            fatalVectorError(NOT_ENOUGH_MEMORY, "V_vector");
        }
    }
    void* raw = nullptr;
    if (n <= (SIZE_MAX - VECTOR_ALIGNMENT) / (size ? size : 1)) raw = std::malloc(n * size + VECTOR_ALIGNMENT);
    if (!raw) {
        guard.unlock();
        fatalVectorError(NOT_ENOUGH_MEMORY, "V_vector");
    }
    uintptr_t aligned = (reinterpret_cast<uintptr_t>(raw) + VECTOR_ALIGNMENT) & ~uintptr_t(VECTOR_ALIGNMENT - 1);
    vectorTable.rawAddresses[vectorTable.count] = raw;
    vectorTable.alignedAddresses[vectorTable.count] = reinterpret_cast<void*>(aligned);
    vectorTable.count++;
    return reinterpret_cast<void*>(aligned);
}

float* VF_vector(size_t n) {
    return static_cast<float*>(V_vector(n, sizeof(float)));
}

fComplex* VCF_vector(size_t n) {
    return static_cast<fComplex*>(V_vector(n, sizeof(fComplex)));
}

dComplex* VCD_vector(size_t n) {
    return static_cast<dComplex*>(V_vector(n, sizeof(dComplex)));
}

void V_free(void* p) {
    std::unique_lock<std::mutex> guard(vectorTableLock);
    int i = 0;
    while (i < vectorTable.count && vectorTable.alignedAddresses[i] != p) i++;
    if (i == vectorTable.count) {
        guard.unlock();
        showVectorError("(12) V_free: Cannot free non-existent vector.\n");
        return;
    }
    std::free(vectorTable.rawAddresses[i]);
    int later = vectorTable.count - i - 1;
    std::memmove(vectorTable.alignedAddresses + i, vectorTable.alignedAddresses + i + 1, later * sizeof(void*));
    std::memmove(vectorTable.rawAddresses + i, vectorTable.rawAddresses + i + 1, later * sizeof(void*));
    vectorTable.count--;
    if (vectorTable.count == 0) {
        std::free(vectorTable.alignedAddresses);
        std::free(vectorTable.rawAddresses);
        vectorTable.alignedAddresses = nullptr;
        vectorTable.rawAddresses = nullptr;
        vectorTable.capacity = 0;
    }
}
