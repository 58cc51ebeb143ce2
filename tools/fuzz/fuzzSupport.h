#pragma once
// What the fuzz targets share, under libFuzzer and in their replay drivers: stopping on a
// broken promise of the code under test, and a private temporary folder.

#include <string>

// A broken promise is a finding: prints "<target>: <what>" and aborts, so the fuzzer keeps
// the input.
void fuzzExpect(bool holds, const char* target, const char* what);
// The target's own temporary folder, ending in "/": made on the first call, removed with
// everything in it when the process ends; aborts when it cannot be made.
const std::string& fuzzFolder(const char* target);
