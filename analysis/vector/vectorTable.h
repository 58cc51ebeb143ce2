#pragma once
// Allocation of the library's vectors: 64-byte aligned blocks handed out by address and
// kept in the vector table, so that V_free can find the raw allocation behind an aligned
// address. Analysis and resynthesis allocate from several threads.

#include <cstddef>

#include "analysis/vector/vectorTypes.h"

constexpr int VECTOR_TABLE_FIRST_CAPACITY = 32;   // entries allocated when the table is first used
constexpr int VECTOR_TABLE_GROWTH = 16;           // entries added whenever the table is full
constexpr size_t VECTOR_ALIGNMENT = 64;           // bytes; every vector address is a multiple

struct VectorTable {
    void** alignedAddresses;   // addresses handed out, in allocation order; nullptr while capacity is 0
    void** rawAddresses;       // the allocation behind each aligned address, same index
    int count;                 // live vectors
    int capacity;              // entries in both arrays; 0 after the last vector is freed
};
extern VectorTable vectorTable;

// Allocate n floats, complex floats or complex doubles, uninitialised, 64-byte aligned.
// Running out of memory reports "(1) V_vector: Not enough memory.\n" and ends the process.
float* VF_vector(size_t n);
fComplex* VCF_vector(size_t n);
dComplex* VCD_vector(size_t n);
// The core of the three: n elements of size bytes each.
void* V_vector(size_t n, size_t size);
// Releases a vector by its aligned address. An address not in the table reports
// "(12) V_free: Cannot free non-existent vector.\n" and changes nothing. Freeing the last
// live vector releases the table, so the next allocation starts again with 32 entries.
void V_free(void* p);
