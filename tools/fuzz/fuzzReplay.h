#pragma once
// The replay driver shared by the fuzz targets: runs a target without libFuzzer over seeds
// built by the target's own code and deterministic mutations of them (the test run uses
// this), over given files (reproducing a finding), or writes the seeds into a folder as the
// libFuzzer corpus.
//   NAME [runs]               seeds, then mutations, runs in all (default given by the target)
//   NAME --write-seeds DIR    one file per seed
//   NAME FILE...              each file once

#include <cstddef>
#include <cstdint>
#include <vector>

using FuzzBytes = std::vector<uint8_t>;
using FuzzTarget = int (*)(const uint8_t* data, size_t size);

int runFuzzReplay(int argc, char** argv, const std::vector<FuzzBytes>& seeds, FuzzTarget target, long defaultRuns,
                  const char* seedSuffix = "");
