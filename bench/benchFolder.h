#pragma once
// A temporary folder for one benchmark run (its shared folder, settings and generated
// files), removed with everything in it when the program ends, and the melody the
// benchmarks open or play written into it.

#include <string>

// Makes the folder (named after the benchmark) and returns its path without a trailing "/";
// ends the program with a message when it cannot be made.
std::string makeBenchFolder(const char* benchmark);

// Writes seconds of the generated melody (44,100 Hz, 16-bit, mono) as a wave file at path;
// false when it cannot be written.
bool writeMelodyWave(const std::string& path, double seconds);
