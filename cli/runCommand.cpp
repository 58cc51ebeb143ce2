// melodrift-cli run IN.wav (--script FILE | -e STATEMENTS)...: opens IN.wav as the desktop
// program does and runs a script of editing statements on it, one statement a line, through
// the same operations the menus and the song view's keys reach:
//   mode wave|midi|note|detail        select-notes all|none|I,J,...     select-time START END
//   command NAME [VALUE]              paste-at SECONDS                  print-notes
//   save-wave FILE [--range]          save-midi FILE [--detail]         notes-csv FILE
// "#" starts a comment. The whole script is read and checked before the file is opened; a
// statement that cannot run (a greyed command, an index that is no note, a file that cannot
// be written) stops the script with exit code 1.
#include "cli/cliCommands.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/waveWorkingFile.h"
#include "cli/cliOutputs.h"
#include "notes/displayModes.h"
#include "notes/selection.h"
#include "notes/songViewInput.h"
#include "notes/songViewKeys.h"
#include "playback/midiOutput.h"
#include "shell/closeSong.h"
#include "shell/commandDispatch.h"
#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "shell/menuEnabling.h"
#include "shell/startup.h"
#include "store/song.h"
#include "store/timeEditing.h"

static const int EXIT_FAILED = 1;
static const int EXIT_USAGE = 2;

struct ScriptStatement {
    int line;                          // 1-based, counted over all script sources
    std::vector<std::string> words;    // the statement's words; words[0] is its keyword
};

// One keyword of the language with the number of words it takes after it.
struct ScriptKeyword {
    const char* name;
    int minWords;
    int maxWords;
};
static const ScriptKeyword scriptKeywords[] = {
    {"mode", 1, 1},      {"select-notes", 1, 1}, {"select-time", 2, 2}, {"command", 1, 2}, {"paste-at", 1, 1},
    {"save-wave", 1, 2}, {"save-midi", 1, 2},    {"notes-csv", 1, 1},   {"print-notes", 0, 0},
};

static int scriptError(int line, const std::string& text) {
    std::fprintf(stderr, "melodrift-cli: run: line %d: %s\n", line, text.c_str());
    return 0;
}

static bool parseNumber(const std::string& text, double* value) {
    char* after = nullptr;
    *value = std::strtod(text.c_str(), &after);
    return after != text.c_str() && *after == '\0' && std::isfinite(*value);
}

// Splits a script's text into statements (lines; in -e text a ";" also ends one).
static void splitStatements(const std::string& text, bool semicolons, int* line, std::vector<ScriptStatement>* out) {
    std::istringstream lines(text);
    std::string raw;
    while (std::getline(lines, raw)) {
        ++*line;
        size_t hash = raw.find('#');
        if (hash != std::string::npos) raw.erase(hash);
        std::vector<std::string> pieces{raw};
        if (semicolons) {
            pieces.clear();
            std::istringstream parts(raw);
            std::string part;
            while (std::getline(parts, part, ';')) pieces.push_back(part);
        }
        for (const std::string& piece : pieces) {
            std::istringstream words(piece);
            ScriptStatement statement{*line, {}};
            std::string word;
            while (words >> word) statement.words.push_back(word);
            if (!statement.words.empty()) out->push_back(statement);
        }
    }
}

// Checks a statement's keyword, word count and fixed words. 1 when it can be run.
static int checkStatement(const ScriptStatement& s) {
    const std::string& keyword = s.words[0];
    int extra = int(s.words.size()) - 1;
    const ScriptKeyword* known = nullptr;
    for (const ScriptKeyword& k : scriptKeywords)
        if (keyword == k.name) known = &k;
    if (!known) return scriptError(s.line, "unknown statement: " + keyword);
    if (extra < known->minWords || extra > known->maxWords)
        return scriptError(s.line, keyword + ": wrong number of words");
    double value;
    if (keyword == "mode" && s.words[1] != "wave" && s.words[1] != "midi" && s.words[1] != "note" &&
        s.words[1] != "detail")
        return scriptError(s.line, "mode takes wave, midi, note or detail");
    if (keyword == "select-time" && (!parseNumber(s.words[1], &value) || !parseNumber(s.words[2], &value)))
        return scriptError(s.line, "select-time takes START END in seconds");
    if (keyword == "paste-at" && (!parseNumber(s.words[1], &value) || value < 0))
        return scriptError(s.line, "paste-at takes a time in seconds");
    if (keyword == "command") {
        if (!findScriptCommand(s.words[1])) return scriptError(s.line, "no command is named " + s.words[1]);
        if (extra == 2 && !parseNumber(s.words[2], &value))
            return scriptError(s.line, s.words[1] + ": the value must be a number");
    }
    if (keyword == "save-wave" && extra == 2 && s.words[2] != "--range")
        return scriptError(s.line, "save-wave takes FILE [--range]");
    if (keyword == "save-midi" && extra == 2 && s.words[2] != "--detail")
        return scriptError(s.line, "save-midi takes FILE [--detail]");
    return 1;
}

// ---- running ----

struct ScriptRun {
    std::string input;   // the wave file being edited: never written over
};

static int runMode(const ScriptStatement& s) {
    const std::string& mode = s.words[1];
    if (mode == "wave") setPlaybackMode(PLAYBACK_MODE_WAVE);
    else if (mode == "midi") setPlaybackMode(PLAYBACK_MODE_MIDI);
    else if (mode == "note") setNoteMode(NOTE_MODE_NOTE);
    else setNoteMode(NOTE_MODE_DETAIL);
    return 1;
}

static int runSelectNotes(const ScriptStatement& s) {
    const std::string& which = s.words[1];
    selection.selectedNoteCount = 0;
    if (which == "all") {
        for (int i = 0; i < noteList.count; i++) selectNote(i);
    } else if (which != "none") {
        std::istringstream list(which);
        std::string item;
        while (std::getline(list, item, ',')) {
            double index;
            if (!parseNumber(item, &index) || index != double(int(index)) || !selectNote(int(index)))
                return scriptError(s.line, "select-notes: " + item + " is no note of the song (0 to " +
                                               std::to_string(noteList.count - 1) + ")");
        }
    }
    selection.anchorNote = selection.selectedNoteCount ? selection.selectedNotes[0] : -1;
    selectionChanged();
    return 1;
}

static int runSelectTime(const ScriptStatement& s) {
    double start = std::strtod(s.words[1].c_str(), nullptr), end = std::strtod(s.words[2].c_str(), nullptr);
    if (start < 0 || end < start) return scriptError(s.line, "select-time: START must be 0 or more and END not before it");
    selection.timeSelectionStart = float(start);
    selection.timeSelectionEnd = float(end);
    // As a stretch dragged out in the view: the notes inside it are selected with it.
    selectNotesInTimeSelection();
    return 1;
}

static int runCommandStatement(const ScriptStatement& s) {
    const CommandEntry* entry = findScriptCommand(s.words[1]);
    if (s.words.size() > 2) return scriptError(s.line, s.words[1] + " takes no value");
    if (!commandEnabled(entry->id, currentMenuState()))
        return scriptError(s.line, s.words[1] + " is not enabled now (" + commandName(entry->id) + " is greyed)");
    dispatchCommand(entry->id);
    return 1;
}

static int runPasteAt(const ScriptStatement& s) {
    if (timeClipboard.kind == 0) return scriptError(s.line, "paste-at: nothing has been copied");
    double at = std::strtod(s.words[1].c_str(), nullptr);
    selection.selectedNoteCount = 0;
    selection.selectedBarlineCount = 0;
    selection.timeSelectionStart = float(at);
    selection.timeSelectionEnd = float(at);
    handleSongViewCode(CODE_PASTE);
    return 1;
}

static int runSaveWave(const ScriptStatement& s, const ScriptRun& run) {
    double start = -1.0, end = -1.0;
    if (s.words.size() > 2) {
        if (!(selection.timeSelectionStart >= 0 &&
              selection.timeSelectionEnd - selection.timeSelectionStart >= song.sampleBlockDuration / 2))
            return scriptError(s.line, "save-wave --range: no time range is selected");
        start = selection.timeSelectionStart;
        end = selection.timeSelectionEnd;
    }
    auto write = [&](const std::string& temporary) { return writeWaveSegment(temporary, start, end); };
    if (!writeOutputFile(s.words[1], run.input, write)) return scriptError(s.line, "the wave was not written");
    return 1;
}

static int runSaveMidi(const ScriptStatement& s, const ScriptRun& run) {
    int detail = s.words.size() > 2 ? 1 : 0;
    auto write = [&](const std::string& temporary) { return saveMidiFile(temporary, detail, 0); };
    if (!writeOutputFile(s.words[1], run.input, write)) return scriptError(s.line, "the MIDI file was not written");
    return 1;
}

static int runStatement(const ScriptStatement& s, const ScriptRun& run) {
    const std::string& keyword = s.words[0];
    if (keyword == "mode") return runMode(s);
    if (keyword == "select-notes") return runSelectNotes(s);
    if (keyword == "select-time") return runSelectTime(s);
    if (keyword == "command") return runCommandStatement(s);
    if (keyword == "paste-at") return runPasteAt(s);
    if (keyword == "save-wave") return runSaveWave(s, run);
    if (keyword == "save-midi") return runSaveMidi(s, run);
    if (keyword == "notes-csv") {
        if (!writeOutputFile(s.words[1], run.input, writeNotesTable))
            return scriptError(s.line, "the notes table was not written");
        return 1;
    }
    printNoteList();
    return 1;
}

int runRunCommand(const std::vector<std::string>& arguments) {
    ScriptRun run;
    std::vector<ScriptStatement> statements;
    int line = 0;
    bool scripted = false;
    for (size_t i = 0; i < arguments.size(); i++) {
        const std::string& word = arguments[i];
        if ((word == "--script" || word == "-e") && i + 1 < arguments.size()) {
            scripted = true;
            std::string text = arguments[++i];
            if (word == "--script") {
                std::ifstream file(text);
                if (!file) {
                    std::fprintf(stderr, "melodrift-cli: run: cannot read the script %s\n", text.c_str());
                    return EXIT_USAGE;
                }
                std::stringstream all;
                all << file.rdbuf();
                text = all.str();
            }
            splitStatements(text, word == "-e", &line, &statements);
        } else if (word.rfind("-", 0) != 0 && run.input.empty()) {
            run.input = word;
        } else {
            std::fprintf(stderr, "melodrift-cli: run: not understood: %s\n", word.c_str());
            return EXIT_USAGE;
        }
    }
    if (run.input.empty() || !scripted) {
        std::fprintf(stderr, "melodrift-cli: run: name a wave file and a script (--script FILE or -e STATEMENTS)\n");
        return EXIT_USAGE;
    }
    for (const ScriptStatement& s : statements)
        if (!checkStatement(s)) return EXIT_USAGE;

    openWaveFile(run.input);
    if (!audioActivity.opening) return EXIT_FAILED;   // refused; the message is on stderr
    waitForOpeningToEnd();
    int result = 0;
    if (song.blockCount == 0) {
        std::fprintf(stderr, "melodrift-cli: %s holds less than one block of audio\n", run.input.c_str());
        result = EXIT_FAILED;
    }
    for (size_t k = 0; result == 0 && k < statements.size(); k++)
        if (!runStatement(statements[k], run)) result = EXIT_FAILED;
    closeSong(appState.keepWorkingFiles);
    return result;
}
