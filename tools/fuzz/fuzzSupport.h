#pragma once
// What the fuzz targets share, under libFuzzer and in their replay drivers: stopping on a
// broken promise of the code under test, a private temporary folder, whole-file reads and
// writes, and little-endian builders for the seeds.

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

// A broken promise is a finding: prints "<target>: <what>" and aborts, so the fuzzer keeps
// the input.
void fuzzExpect(bool holds, const char* target, const char* what);
// The target's own temporary folder, ending in "/": made on the first call, removed with
// everything in it when the process ends; aborts when it cannot be made.
const std::string& fuzzFolder(const char* target);

// A file's bytes (none when it cannot be read); writing gives 1 when the file holds them all.
std::vector<uint8_t> fuzzReadFile(const std::string& path);
int fuzzWriteFile(const std::string& path, const uint8_t* bytes, size_t count);
// Appends little-endian values.
void fuzzPut16(std::vector<uint8_t>& b, uint32_t v);
void fuzzPut32(std::vector<uint8_t>& b, uint32_t v);
void fuzzPutFloat(std::vector<uint8_t>& b, float v);
