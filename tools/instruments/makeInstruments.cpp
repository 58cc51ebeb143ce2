// makeInstruments: writes the instrument definitions delivered with the program
// (Resources/CSInst.dat) from the program's own generated models, or checks that a file holds
// exactly what it would write. The committed Resources/CSInst.dat is this tool's output; the
// test run checks it with --check.
//   makeInstruments OUT.dat           write the delivered definitions to OUT.dat
//   makeInstruments --check FILE      exit 0 when FILE holds the same bytes, 1 when not
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include <unistd.h>

#include "analysis/instrumentDefinitions.h"
#include "analysis/instrumentModels.h"
#include "platform/ui.h"

static std::vector<char> fileBytes(const std::string& path) {
    std::ifstream in(path, std::ios::binary);
    return std::vector<char>(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

int main(int argc, char** argv) {
    std::vector<std::string> words(argv + 1, argv + argc);
    bool check = words.size() == 2 && words[0] == "--check";
    if (!(words.size() == 1 && words[0].rfind("--", 0) != 0) && !check) {
        std::fprintf(stderr, "Usage: makeInstruments OUT.dat | makeInstruments --check FILE\n");
        return 2;
    }
    setUiEcho(true);
    std::string target = check ? words[1] : words[0];
    // A check generates into the temporary folder, so the file checked is never touched.
    std::string output = check ? (std::filesystem::temp_directory_path() /
                                  ("makeInstruments-" + std::to_string(getpid()) + ".dat"))
                                     .string()
                               : target + ".made";
    setInstrumentDefinitionsFile(output);
    if (!createDeliveredInstruments()) return 1;
    std::error_code error;
    if (check) {
        bool same = fileBytes(output) == fileBytes(target);
        std::filesystem::remove(output, error);
        if (!same) {
            std::fprintf(stderr, "makeInstruments: %s is not what the program generates; run makeInstruments %s\n",
                         target.c_str(), target.c_str());
            return 1;
        }
        std::printf("%s: %zu definitions, as generated\n", target.c_str(), instrumentDefinitions.definitions.size());
        return 0;
    }
    std::filesystem::rename(output, target, error);
    if (error) {
        std::fprintf(stderr, "makeInstruments: cannot write %s\n", target.c_str());
        return 1;
    }
    for (const InstrumentDefinition& d : instrumentDefinitions.definitions)
        std::printf("%s\n", instrumentDefinitionText(d).c_str());
    return 0;
}
