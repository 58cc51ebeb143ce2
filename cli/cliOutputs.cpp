// Output files and note listings of the command-line tool.
#include "cli/cliOutputs.h"

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <sys/stat.h>
#include <unistd.h>

#include "notes/noteList.h"
#include "platform/files.h"
#include "platform/ui.h"

int writeOutputFile(const std::string& path, const std::string& input,
                    const std::function<int(const std::string& temporary)>& write) {
    std::error_code error;
    if (!input.empty() && std::filesystem::equivalent(path, input, error)) {
        std::fprintf(stderr, "melodrift-cli: %s is the file being read; the output needs another name\n", path.c_str());
        return 0;
    }
    std::string pattern = path + ".tmp-XXXXXX";
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    int descriptor = mkstemp(name.data());
    if (descriptor < 0) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    // mkstemp makes the file private; an output gets the permissions of any new file of the user.
    mode_t mask = umask(0);
    umask(mask);
    fchmod(descriptor, 0666 & ~mask);
    close(descriptor);
    std::string temporary = name.data();
    if (!write(temporary)) {
        fileDelete(temporary);
        return 0;
    }
    if (renameFile(temporary, path) != 0) {
        fileDelete(temporary);
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    return 1;
}

void writeNotesRows(FILE* csv) {
    std::fprintf(csv, "onset_s,offset_s,midi_pitch,pitch_hz,volume_sum\n");
    for (int i = 0; i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        std::fprintf(csv, "%.4f,%.4f,%u,%.2f,%u\n", double(n.waveStart), double(n.waveEnd), unsigned(n.midiNote),
                     double(n.pitch), n.volumeSum);
    }
}

int writeNotesTable(const std::string& path) {
    FILE* csv = fileOpen(path, "w");
    if (!csv) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    writeNotesRows(csv);
    bool failed = std::ferror(csv) != 0;
    if (fileClose(csv) != 0 || failed) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    return 1;
}

std::string noteName(int midiNote) {
    static const char* const names[12] = {"C", "C#", "D", "D#", "E", "F", "F#", "G", "G#", "A", "A#", "B"};
    return std::string(names[midiNote % 12]) + std::to_string(midiNote / 12 - 1);
}

void printNoteList() {
    std::printf("Notes: %d\n", noteList.count);
    std::printf("  %5s %8s %8s  %-4s %8s %6s\n", "index", "start s", "end s", "note", "Hz", "volume");
    for (int i = 0; i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        std::printf("  %5d %8.3f %8.3f  %-4s %8.1f %6u\n", i, double(n.waveStart), double(n.waveEnd),
                    noteName(n.midiNote).c_str(), double(n.pitch), n.volumeSum);
    }
}
