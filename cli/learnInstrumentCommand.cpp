// melodrift-cli learn-instrument [--replace] [--output FILE] FILE...: learns instrument
// definitions from reference recordings named with the definition's parameters, as the
// instrument window's Learn (or Replace) command does, into the definitions file in use or
// into FILE. Prints each learnt definition's line as the instrument window shows it.
#include "cli/cliCommands.h"

#include <cstdio>
#include <string>

#include "analysis/instrumentDefinitions.h"
#include "analysis/instrumentLearning.h"

int runLearnInstrumentCommand(const std::vector<std::string>& arguments) {
    std::vector<std::string> files;
    std::string output;
    int replace = 0;
    for (size_t i = 0; i < arguments.size(); i++) {
        if (arguments[i] == "--replace") {
            replace = 1;
        } else if (arguments[i] == "--output" && i + 1 < arguments.size()) {
            output = arguments[++i];
        } else if (arguments[i].rfind("--", 0) == 0) {
            std::fprintf(stderr, "melodrift-cli: learn-instrument: unknown option or missing file: %s\n",
                         arguments[i].c_str());
            return 2;
        } else {
            files.push_back(arguments[i]);
        }
    }
    if (files.empty()) {
        std::fprintf(stderr, "melodrift-cli: learn-instrument: expected [--replace] [--output FILE] FILE...\n");
        return 2;
    }
    // Another file starts from what it holds already, as the file in use does.
    if (!output.empty()) setInstrumentDefinitionsFile(output);
    loadInstrumentDefinitions();
    int failed = 0;
    for (const std::string& file : files) {
        if (!learnFromFile(file, replace)) {
            failed++;
            continue;
        }
        const InstrumentDefinition& d = instrumentDefinitions.definitions[size_t(instrumentDefinitions.current)];
        std::printf("%s: %s\n", file.c_str(), instrumentDefinitionText(d).c_str());
    }
    std::printf("Definitions: %zu in %s\n", instrumentDefinitions.definitions.size(),
                instrumentDefinitionsPath().c_str());
    freeInstrumentDefinitions();
    return failed ? 1 : 0;
}
