#pragma once
// The command-line tool's commands. Each runs on the main loop after start-up, prints its
// results on stdout, lets the engine's messages go to stderr, and returns the exit code.

#include <string>
#include <vector>

struct CliCommand {
    const char* name;                                     // first word on the command line
    const char* usage;                                    // its arguments, for the help text
    const char* summary;                                  // one line on what it does
    int minArguments;                                     // after the name
    int (*run)(const std::vector<std::string>& arguments);
};

const std::vector<CliCommand>& cliCommands();
const CliCommand* findCliCommand(const std::string& name);

// info FILE: what the wave reader finds in FILE, or why it refuses it.
int runInfoCommand(const std::vector<std::string>& arguments);
// analyse IN.wav --ft-csv OUT.csv: the frequency tables of IN.wav, one CSV row per entry.
int runAnalyseCommand(const std::vector<std::string>& arguments);
// learn-instrument [--replace] [--output FILE] FILE...: instrument definitions learnt from recordings.
int runLearnInstrumentCommand(const std::vector<std::string>& arguments);
