// The table of the command-line tool's commands.
#include "cli/cliCommands.h"

const std::vector<CliCommand>& cliCommands() {
    static const std::vector<CliCommand> commands = {
        {"info", "FILE", "print the format, size and duration of a wave file", 1, runInfoCommand},
        {"analyse", "IN.wav [--pitch-range 0|1|2] [--enhanced] [--boost] [--ft-csv FILE] [--notes-csv FILE] [--pitch-csv FILE]",
         "analyse a wave file and recognise its notes; write the tables, notes and pitch track as CSV", 1,
         runAnalyseCommand},
        {"open",
         "IN.wav|IN.mid [--midi OUT.mid [--detail]] [--wave OUT.wav [--range START END]] [--notes-csv FILE] "
         "[--pitch-range 0|1|2] [--enhanced] [--boost]",
         "open a wave or MIDI file as the desktop program does, print its notes, save them as MIDI and the song "
         "as a wave",
         1, runOpenCommand},
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
