#pragma once
// A temporary folder for one benchmark run (its shared folder, settings and generated
// files), removed with everything in it when the program ends.

#include <string>

// Makes the folder (named after the benchmark) and returns its path without a trailing "/";
// ends the program with a message when it cannot be made.
std::string makeBenchFolder(const char* benchmark);
