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
// Opens input as File > Open does and waits for the opening to end: 1 when the song holds at
// least one block; 0 after the reason was given (the song is closed again).
int openSongFromCommandLine(const std::string& input);
// The notes as CSV (onset_s,offset_s,midi_pitch,pitch_hz,volume_sum); 1, or 0 after "Cannot " and the path.
int writeSongNotesCsv(const std::string& path);
// A number of seconds, 0 or more, as the whole word; false for anything else.
bool parseSeconds(const std::string& text, double* seconds);

// info FILE: what the wave reader finds in FILE, or why it refuses it.
int runInfoCommand(const std::vector<std::string>& arguments);
// analyse IN.wav [options]: the whole-song analysis of IN.wav; the frequency tables, the notes
// and the pitch track as CSV files.
int runAnalyseCommand(const std::vector<std::string>& arguments);
// open IN.wav|IN.mid [--midi OUT.mid [--detail]] [--wave OUT.wav [--range START END]] [--notes-csv FILE]
// [--pitch-range 0|1|2] [--enhanced] [--boost]: opens a wave or MIDI file as the desktop program
// does, prints its notes and saves them and the song.
int runOpenCommand(const std::vector<std::string>& arguments);
// play FILE [--midi] [--from S] [--to E]: opens FILE and plays the song through the sound server.
int runPlayCommand(const std::vector<std::string>& arguments);
// record OUT.wav --seconds N [--from-file FILE [--fast]] [--notes-csv FILE] [--midi FILE]: records
// from the default input (or a wave file fed in its place) and saves the song and its notes.
int runRecordCommand(const std::vector<std::string>& arguments);
// run IN.wav (--script FILE | -e STATEMENTS)...: opens IN.wav and runs an editing script on it.
int runRunCommand(const std::vector<std::string>& arguments);
// learn-instrument [--replace] [--output FILE] FILE...: instrument definitions learnt from recordings.
int runLearnInstrumentCommand(const std::vector<std::string>& arguments);
