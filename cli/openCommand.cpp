// melodrift-cli open IN.wav|IN.mid [--midi OUT.mid [--detail]] [--wave OUT.wav [--range START END]]
// [--notes-csv FILE] [--pitch-range 0|1|2] [--enhanced] [--boost]: opens a wave file the way
// the desktop program's Open does (the opening worker analyses it chunk by chunk while the
// main loop runs), or reads a MIDI file's notes as Open does, prints the notes and saves them
// as a MIDI file and the song's audio as a wave file. The analysis options are preferences
// for this run only. `analyse` hands its --midi and --wave requests here.
#include "cli/cliCommands.h"
#include "cli/cliOutputs.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <string>

#include "audio/openWaveFile.h"
#include "audio/waveWorkingFile.h"
#include "notes/noteList.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "shell/closeSong.h"
#include "shell/settings.h"
#include "store/song.h"

static const int EXIT_FAILED = 1;
static const int EXIT_USAGE = 2;
static const int LISTED_NOTES = 40;   // longer note lists are cut in the printout (not in the files)

struct OpenRequest {
    std::string input;       // the wave file to open
    std::string midiPath;    // "" for no MIDI file
    bool detail = false;     // the MIDI file follows the sung pitch
    std::string wavePath;    // "" for no wave file
    double start = -1.0;     // seconds; -1.0 for the song's start
    double end = -1.0;       // seconds; -1.0 for the song's end
    std::string notesPath;   // "" for no notes table
    int pitchRange = -1;     // "CS Pitch range" for this run; -1: the preference in force
    bool enhanced = false;   // "CS Enhanced pitch accuracy" for this run
    bool boost = false;      // "CS Boost speed" for this run
};

// Reads the arguments after the command's name; false (after saying why) when they are not
// understood.
static bool parseOpenRequest(const std::vector<std::string>& arguments, OpenRequest* request) {
    for (size_t i = 0; i < arguments.size(); i++) {
        const std::string& word = arguments[i];
        bool hasValue = i + 1 < arguments.size();
        if (word == "--midi" && hasValue) request->midiPath = arguments[++i];
        else if (word == "--detail") request->detail = true;
        else if (word == "--wave" && hasValue) request->wavePath = arguments[++i];
        else if (word == "--notes-csv" && hasValue) request->notesPath = arguments[++i];
        else if (word == "--enhanced") request->enhanced = true;
        else if (word == "--boost") request->boost = true;
        else if (word == "--pitch-range" && hasValue && (arguments[i + 1] == "0" || arguments[i + 1] == "1" ||
                                                          arguments[i + 1] == "2"))
            request->pitchRange = arguments[++i][0] - '0';
        else if (word == "--ft-csv" || word == "--pitch-csv") {
            std::fprintf(stderr, "melodrift-cli: %s is analyse's own and does not go with --midi or --wave\n",
                         word.c_str());
            return false;
        }
        else if (word == "--range" && i + 2 < arguments.size()) {
            if (!parseSeconds(arguments[i + 1], &request->start) || !parseSeconds(arguments[i + 2], &request->end) ||
                request->end <= request->start) {
                std::fprintf(stderr, "melodrift-cli: --range takes START END in seconds, START before END\n");
                return false;
            }
            i += 2;
        } else if (word.rfind("--", 0) != 0 && request->input.empty()) request->input = word;
        else {
            std::fprintf(stderr, "melodrift-cli: open: not understood: %s\n", word.c_str());
            return false;
        }
    }
    if (request->input.empty()) {
        std::fprintf(stderr, "melodrift-cli: open: no wave or MIDI file named\n");
        return false;
    }
    if (request->detail && request->midiPath.empty()) {
        std::fprintf(stderr, "melodrift-cli: --detail goes with --midi OUT.mid\n");
        return false;
    }
    if (isMidiFileName(request->input) && !request->wavePath.empty()) {
        std::fprintf(stderr, "melodrift-cli: --wave needs a recording; %s holds only notes\n", request->input.c_str());
        return false;
    }
    if (request->start >= 0 && request->wavePath.empty()) {
        std::fprintf(stderr, "melodrift-cli: --range goes with --wave OUT.wav\n");
        return false;
    }
    return true;
}

static void printSummary(const OpenRequest& request) {
    const OpeningState& o = openingState;
    std::printf("File: %s\n", request.input.c_str());
    if (song.notesOnly) {
        std::printf("MIDI file: %.3f s, %d part%s", songDuration(), midiImport.partCount,
                    midiImport.partCount == 1 ? "" : "s");
        for (int p = 0; p < midiImport.partCount; p++)
            std::printf("%s %s", p ? "," : ":", midiImport.parts[p].name.c_str());
        std::printf("\n");
    } else {
        std::printf("Source: %u Hz, %u-bit, %u channel%s, %.3f s\n", o.sourceFormat.samplesPerSec,
                    o.sourceFormat.bitsPerSample, o.sourceFormat.channels, o.sourceFormat.channels == 1 ? "" : "s",
                    double(o.sourceDuration));
        std::printf("Analysed: %.3f s in %u blocks of %.6f s\n", songDuration(), song.blockCount,
                    song.sampleBlockDuration);
    }
    if (noteList.count == 0) {
        std::printf("Notes: none found\n");
        return;
    }
    int low = 127, high = 0;
    for (int i = 0; i < noteList.count; i++) {
        low = std::min(low, int(noteList.notes[i].midiNote));
        high = std::max(high, int(noteList.notes[i].midiNote));
    }
    std::printf("Notes: %d, from %s to %s\n", noteList.count, noteName(low).c_str(), noteName(high).c_str());
    std::printf("  %8s %8s  %-4s %8s\n", "start s", "end s", "note", "Hz");
    for (int i = 0; i < noteList.count && i < LISTED_NOTES; i++) {
        const Note& n = noteList.notes[i];
        std::printf("  %8.3f %8.3f  %-4s %8.1f\n", double(n.waveStart), double(n.waveEnd), noteName(n.midiNote).c_str(),
                    double(n.pitch));
    }
    if (noteList.count > LISTED_NOTES) std::printf("  ... and %d more\n", noteList.count - LISTED_NOTES);
}

static int writeOutputs(const OpenRequest& request) {
    int written = 1;
    if (!request.notesPath.empty()) {
        if (writeSongNotesCsv(request.notesPath)) std::printf("Notes table: %s\n", request.notesPath.c_str());
        else written = 0;
    }
    if (!request.midiPath.empty()) {
        // The notes of a MIDI file have no sung pitch for a detail file to follow.
        bool detail = request.detail && !song.notesOnly;
        if (saveMidiFile(request.midiPath, detail ? 1 : 0, 0))
            std::printf("MIDI file: %s (%s)\n", request.midiPath.c_str(), detail ? "detail" : "plain");
        else written = 0;
    }
    if (!request.wavePath.empty()) {
        if (writeWaveSegment(request.wavePath, request.start, request.end)) {
            if (request.start < 0) std::printf("Wave file: %s (the whole song)\n", request.wavePath.c_str());
            else std::printf("Wave file: %s (%.3f to %.3f s)\n", request.wavePath.c_str(), request.start, request.end);
        } else {
            // The file routines report a file that cannot be written; the working file's own
            // failure is silent there.
            std::fprintf(stderr, "melodrift-cli: the song could not be written to %s\n", request.wavePath.c_str());
            written = 0;
        }
    }
    return written;
}

int runOpenCommand(const std::vector<std::string>& arguments) {
    OpenRequest request;
    if (!parseOpenRequest(arguments, &request)) return EXIT_USAGE;
    // The options are this run's preferences; the stored ones come back before shut-down
    // saves them. An opening into an empty song offers no preferences dialog here.
    GeneralSettings savedGeneral = generalSettings;
    GlobalSettings savedGlobal = globalSettings;
    struct RestoreSettings {
        GeneralSettings* general;
        GlobalSettings* global;
        ~RestoreSettings() {
            generalSettings = *general;
            globalSettings = *global;
        }
    } restoreSettings{&savedGeneral, &savedGlobal};
    if (request.pitchRange >= 0) generalSettings.pitchRange = request.pitchRange;
    if (request.enhanced) generalSettings.enhancedPitchAccuracy = true;
    if (request.boost) globalSettings.boostSpeed = true;
    if (isMidiFileName(request.input)) {
        // The file's notes become a song of notes only, read on the main thread as Open does.
        int result = EXIT_FAILED;
        if (importMidiFile(request.input)) {
            printSummary(request);
            result = writeOutputs(request) ? 0 : EXIT_FAILED;
        }
        closeSong();
        return result;
    }
    if (!openSongFromCommandLine(request.input)) return EXIT_FAILED;
    printSummary(request);
    int result = writeOutputs(request) ? 0 : EXIT_FAILED;
    closeSong();
    return result;
}
