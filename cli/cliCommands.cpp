// The table of the command-line tool's commands.
#include "cli/cliCommands.h"

#include <cstdio>
#include <cstdlib>

#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "cli/cliOutputs.h"
#include "notes/noteList.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "store/song.h"

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
        {"play", "FILE [--midi] [--from S] [--to E]",
         "open a wave file and play the song (its notes with --midi) through the sound server, S to E seconds", 1,
         runPlayCommand},
        {"record", "OUT.wav --seconds N [--from-file FILE [--fast]] [--notes-csv FILE] [--midi FILE]",
         "record N seconds from the default input (or a wave file fed in its place) and save the song and its notes",
         1, runRecordCommand},
        {"run", "IN.wav (--script FILE | -e STATEMENTS)...",
         "open a wave file and run an editing script on it: mode, select-notes, select-time, command, paste-at, "
         "save-wave, save-midi, notes-csv, print-notes (one statement a line)",
         3, runRunCommand},
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

bool parseSeconds(const std::string& text, double* seconds) {
    char* after = nullptr;
    double value = std::strtod(text.c_str(), &after);
    if (after == text.c_str() || *after != '\0' || !(value >= 0)) return false;
    *seconds = value;
    return true;
}

int openSongFromCommandLine(const std::string& input) {
    openWaveFile(input);
    if (!audioActivity.opening) {
        closeSong();
        return 0;   // refused; the message is on stderr
    }
    waitForOpeningToEnd();
    if (song.blockCount > 0) return 1;
    std::fprintf(stderr, "melodrift-cli: %s holds less than one block of audio\n", input.c_str());
    closeSong();
    return 0;
}

// The table goes to a new file beside path, renamed over it once it is complete.
int writeSongNotesCsv(const std::string& path) {
    std::string temporary;
    FILE* csv = createFileBeside(path, &temporary);
    if (!csv) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    writeNotesRows(csv);
    bool failed = std::ferror(csv) != 0;
    if (fileClose(csv) != 0 || failed || renameFile(temporary, path) != 0) {
        fileDelete(temporary);
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    return 1;
}
