// The table of the command-line tool's commands.
#include "cli/cliCommands.h"

const std::vector<CliCommand>& cliCommands() {
    static const std::vector<CliCommand> commands = {
        {"info", "FILE", "print the format, size and duration of a wave file", 1, runInfoCommand},
        {"analyse", "IN.wav --ft-csv OUT.csv", "write the frequency tables of a wave file as CSV", 3, runAnalyseCommand},
        {"learn-instrument", "[--replace] [--output FILE] FILE...",
         "learn instrument definitions from recordings named with their parameters", 1, runLearnInstrumentCommand},
    };
    return commands;
}

const CliCommand* findCliCommand(const std::string& name) {
    for (const CliCommand& command : cliCommands())
        if (name == command.name) return &command;
    return nullptr;
}
