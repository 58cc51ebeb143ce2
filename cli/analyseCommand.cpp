// melodrift-cli analyse IN.wav [--pitch-range 0|1|2] [--enhanced] [--boost] [--ft-csv FILE]
// [--notes-csv FILE] [--pitch-csv FILE]: the whole-song analysis of a wave file. The file is
// analysed chunk by chunk with the preferences in force (the options set them for this run
// only), its FT and Hires FT blocks are stored in the working files as when a file is opened,
// and recognition follows the analysis. The CSV files show the frequency tables (one row per
// entry), the notes (one row per note) and the pitch track (one row per block).
#include "cli/cliCommands.h"

#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/noteRecognition.h"
#include "analysis/pitchScale.h"
#include "analysis/wholeSongAnalysis.h"
#include "audio/waveFile.h"
#include "audio/waveWorkingFile.h"
#include "notes/noteList.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "shell/closeSong.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

static const uint32_t HIGHEST_SAMPLE_RATE = 44100;   // the opening path refuses faster files
static const char* const RATE_TOO_HIGH_TEXT =
    "Sorry - this wave file cannot be opened.\n\n44100Hz is the highest sample rate supported by this product.";
static const char* const USAGE_TEXT =
    "melodrift-cli: analyse: expected IN.wav [--pitch-range 0|1|2] [--enhanced] [--boost] [--ft-csv FILE] "
    "[--notes-csv FILE] [--pitch-csv FILE]\n";

struct AnalyseOutputs {
    FILE* ftCsv;                // the FT table, or nullptr
    std::vector<float> pitch;   // Hz of each block after recognition, 0 when unpitched
};

// The pitches of the blocks the last recognition run decided (they may be decided again by
// the next run, which overwrites them here).
static void keepRecognisedPitches(AnalyseOutputs& out) {
    const FTBlockWindow& w = ftBlockWindow;
    uint32_t from = std::max(recognitionPass.finalBlock, w.firstBlock);
    uint32_t to = std::min(recognitionPass.endBlock, w.endBlock);
    if (out.pitch.size() < song.blockCount) out.pitch.resize(song.blockCount, 0.0f);
    for (uint32_t b = from; b < to; b++) out.pitch[b] = float(blockPitch(b));
}

static int chunkDone(void* context, uint32_t firstBlock, uint32_t endBlock) {
    AnalyseOutputs& out = *static_cast<AnalyseOutputs*>(context);
    keepRecognisedPitches(out);
    if (!out.ftCsv) return 1;
    // The entries as the analysis made them: recognition reduces the dataBuffers to the pitch.
    const FTBlockWindow& w = ftBlockWindow;
    for (uint32_t b = firstBlock; b < endBlock; b++) {
        const FTDataBuffer& data = w.origDataBuffers[b - w.firstBlock];
        double time = songTimeOfBlock(b);
        if (data.nEntries == 0)
            std::fprintf(out.ftCsv, "%u,%.6f,%u,0,0\n", b, time, unsigned(data.blockLoudness));
        for (uint32_t i = 0; i < data.nEntries; i++)
            std::fprintf(out.ftCsv, "%u,%.6f,%u,%.3f,%u\n", b, time, unsigned(data.blockLoudness),
                         double(data.entries[i].frequency), unsigned(data.entries[i].amplitude));
    }
    return std::ferror(out.ftCsv) ? 0 : 1;
}

static int writeNotesCsv(const std::string& path) {
    FILE* csv = fileOpen(path, "w");
    if (!csv) return 0;
    std::fprintf(csv, "onset,offset,midi_pitch,pitch_hz,volume\n");
    double blockSeconds = song.sampleBlockDuration;
    for (int i = 0; i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        // volumeSum sums the note's blocks; its block count is its length in blocks.
        double blocks = blockSeconds > 0.0 ? (double(n.midiEnd) - double(n.midiStart)) / blockSeconds : 0.0;
        int count = int(blocks + 0.5);
        double volume = count > 0 ? double(n.volumeSum) / count : 0.0;
        std::fprintf(csv, "%.6f,%.6f,%.4f,%.3f,%.3f\n", double(n.waveStart), double(n.waveEnd),
                     frequencyToPitch(n.pitch, 440.0), double(n.pitch), volume);
    }
    bool failed = std::ferror(csv);
    return std::fclose(csv) == 0 && !failed;
}

static int writePitchCsv(const std::string& path, const std::vector<float>& pitch) {
    FILE* csv = fileOpen(path, "w");
    if (!csv) return 0;
    std::fprintf(csv, "time,hz\n");
    double start = 0.0;
    for (uint32_t b = 0; b < song.blockCount; b++) {
        double d = blockDuration(b);
        std::fprintf(csv, "%.6f,%.3f\n", start + d / 2, b < pitch.size() ? double(pitch[b]) : 0.0);
        start += d;
    }
    bool failed = std::ferror(csv);
    return std::fclose(csv) == 0 && !failed;
}

struct AnalyseArguments {
    std::string path, ftCsv, notesCsv, pitchCsv;
    int pitchRange = -1;   // -1: the preference in force
    bool enhanced = false;
    bool boost = false;
};

static bool parseArguments(const std::vector<std::string>& arguments, AnalyseArguments& a) {
    if (arguments.empty() || arguments[0].rfind("--", 0) == 0) return false;
    a.path = arguments[0];
    for (size_t i = 1; i < arguments.size(); i++) {
        const std::string& option = arguments[i];
        bool hasValue = i + 1 < arguments.size();
        if (option == "--enhanced") a.enhanced = true;
        else if (option == "--boost") a.boost = true;
        else if (option == "--pitch-range" && hasValue && arguments[i + 1].size() == 1 && arguments[i + 1][0] >= '0' &&
                 arguments[i + 1][0] <= '2')
            a.pitchRange = arguments[++i][0] - '0';
        else if (option == "--ft-csv" && hasValue) a.ftCsv = arguments[++i];
        else if (option == "--notes-csv" && hasValue) a.notesCsv = arguments[++i];
        else if (option == "--pitch-csv" && hasValue) a.pitchCsv = arguments[++i];
        else return false;
    }
    return true;
}

int runAnalyseCommand(const std::vector<std::string>& arguments) {
    // Saving the notes or the song goes through the opening path, as File > Open opens a file.
    for (const std::string& word : arguments)
        if (word == "--midi" || word == "--wave") return runOpenCommand(arguments);
    AnalyseArguments a;
    if (!parseArguments(arguments, a)) {
        std::fprintf(stderr, "%s", USAGE_TEXT);
        return 2;
    }
    WaveReadInfo info{};
    if (openCheckedWaveFile(&info, a.path) != WIO_OPENED) return 1;
    if (info.format->samplesPerSec > HIGHEST_SAMPLE_RATE) {
        wioFileClose(&info);
        showMessage(MESSAGE_ERROR, RATE_TOO_HIGH_TEXT);
        return 1;
    }
    acceptWaveFormat(*info.format);
    AnalyseOutputs out{nullptr, {}};
    if (!a.ftCsv.empty()) {
        out.ftCsv = fileOpen(a.ftCsv, "w");
        if (!out.ftCsv) {
            wioFileClose(&info);
            showMessage(MESSAGE_ERROR, "Cannot " + a.ftCsv);
            return 1;
        }
        std::fprintf(out.ftCsv, "block,time_s,loudness,frequency_hz,amplitude\n");
    }

    // The options are this run's preferences; the stored ones come back before shut-down saves them.
    GeneralSettings savedGeneral = generalSettings;
    GlobalSettings savedGlobal = globalSettings;
    if (a.pitchRange >= 0) generalSettings.pitchRange = a.pitchRange;
    if (a.enhanced) generalSettings.enhancedPitchAccuracy = true;
    if (a.boost) globalSettings.boostSpeed = true;

    int analysed = 0;
    double recognitionSeconds = 0.0;
    ChunkedAnalysisTimes times{};
    if (setupFrequencyAnalysis() && openFTFile(FT_UPDATE)) {
        if (openHiresFTFile(FT_UPDATE)) {
            fileSeek(info.file, info.dataOffset, SEEK_SET);
            WaveFrameSource source{&info, info.dataSamples};
            analysed = analyseWithRecognition(readWaveFrameSource, &source, chunkDone, &out, &times, &recognitionSeconds);
            if (analysed) keepRecognisedPitches(out);
            closeHiresFTFile(1);
        }
        closeFTFile(1);
    }
    releaseFrequencyAnalysis();
    wioFileClose(&info);
    generalSettings = savedGeneral;
    globalSettings = savedGlobal;

    int written = 1;
    if (out.ftCsv && std::fclose(out.ftCsv) != 0) {
        if (analysed) showMessage(MESSAGE_ERROR, "Cannot " + a.ftCsv);
        written = 0;
    }
    if (analysed && !a.notesCsv.empty() && !writeNotesCsv(a.notesCsv)) {
        showMessage(MESSAGE_ERROR, "Cannot " + a.notesCsv);
        written = 0;
    }
    if (analysed && !a.pitchCsv.empty() && !writePitchCsv(a.pitchCsv, out.pitch)) {
        showMessage(MESSAGE_ERROR, "Cannot " + a.pitchCsv);
        written = 0;
    }
    if (analysed && written) {
        const AnalysisGeometry& g = analysisGeometry;
        std::printf("File: %s\n", a.path.c_str());
        std::printf("Blocks: %u of %u samples (%.6f s)\n", song.blockCount, g.blockSamples, g.sampleBlockDuration);
        std::printf("Analysed: %.3f s\n", songDuration());
        std::printf("Levels: %d (group of %u blocks), pitch bins: %d, semitone divisions: %g\n", g.levels, g.group,
                    g.pitchBins, g.semitoneDivisions);
        std::printf("Frequency range: %.1f to %.1f Hz\n", g.lowestAnalysed, g.highestAnalysed);
        std::printf("Notes: %d\n", noteList.count);
        std::printf("Processor time: analysis %.3f s, recognition %.3f s\n", times.spectrogram + times.tables + times.storing,
                    recognitionSeconds);
        if (!a.ftCsv.empty()) std::printf("FT table: %s\n", a.ftCsv.c_str());
        if (!a.notesCsv.empty()) std::printf("Notes table: %s\n", a.notesCsv.c_str());
        if (!a.pitchCsv.empty()) std::printf("Pitch table: %s\n", a.pitchCsv.c_str());
    }
    closeSong();
    resetNoteRecognition();
    return analysed && written ? 0 : 1;
}
