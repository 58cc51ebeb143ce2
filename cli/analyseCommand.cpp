// melodrift-cli analyse IN.wav --ft-csv OUT.csv: the frequency tables the program makes of a
// wave file, as a table a person can read: one row per FT entry of every block. The file is
// analysed chunk by chunk with the preferences in force, and its FT and Hires FT blocks are
// stored in the working files as when a file is opened; no notes are recognised.
#include "cli/cliCommands.h"

#include <cstdio>
#include <string>

#include "analysis/analysisGeometry.h"
#include "analysis/chunkedAnalysis.h"
#include "analysis/frequencyAnalysis.h"
#include "audio/waveFile.h"
#include "audio/waveWorkingFile.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "store/workingFiles.h"

static const uint32_t HIGHEST_SAMPLE_RATE = 44100;   // the opening path refuses faster files
static const char* const RATE_TOO_HIGH_TEXT =
    "Sorry - this wave file cannot be opened.\n\n44100Hz is the highest sample rate supported by this product.";

struct WaveSource {
    WaveReadInfo* info;      // the open file, positioned in its data
    uint32_t samplesLeft;    // frames of the data chunk not read yet
};

static uint32_t readWaveSource(void* context, uint8_t* destination, uint32_t count) {
    WaveSource& s = *static_cast<WaveSource*>(context);
    uint32_t bytesPerSample = s.info->format->bitsPerSample / 8;
    uint32_t wanted = count < s.samplesLeft ? count : s.samplesLeft;
    if (wanted == 0) return 0;
    uint32_t got = downmixFrames(s.info->file, *s.info->format, destination, wanted * bytesPerSample) / bytesPerSample;
    s.samplesLeft = got < wanted ? 0 : s.samplesLeft - got;
    return got;
}

static int writeBlockRows(void* context, uint32_t firstBlock, uint32_t endBlock) {
    FILE* csv = static_cast<FILE*>(context);
    const FTBlockWindow& w = ftBlockWindow;
    for (uint32_t b = firstBlock; b < endBlock; b++) {
        const FTDataBuffer& data = w.dataBuffers[b - w.firstBlock];
        double time = songTimeOfBlock(b);
        if (data.nEntries == 0)
            std::fprintf(csv, "%u,%.6f,%u,0,0\n", b, time, unsigned(data.blockLoudness));
        for (uint32_t i = 0; i < data.nEntries; i++)
            std::fprintf(csv, "%u,%.6f,%u,%.3f,%u\n", b, time, unsigned(data.blockLoudness),
                         double(data.entries[i].frequency), unsigned(data.entries[i].amplitude));
    }
    return std::ferror(csv) ? 0 : 1;
}

static int refuse(WaveReadInfo& info, uint32_t code) {
    if (info.file) wioFileClose(&info);
    if (code != WIO_DECLINED) showMessage(MESSAGE_ERROR, waveOpenMessage(code));
    return 1;
}

int runAnalyseCommand(const std::vector<std::string>& arguments) {
    if (arguments.size() != 3 || arguments[1] != "--ft-csv") {
        std::fprintf(stderr, "melodrift-cli: analyse: expected IN.wav --ft-csv OUT.csv\n");
        return 2;
    }
    const std::string& path = arguments[0];
    const std::string& csvPath = arguments[2];
    WaveReadInfo info{};
    uint32_t code = wioFileOpen(&info, path, 0);
    if (code != WIO_OPENED) return refuse(info, code);
    code = checkWaveFileFormat(info);
    if (code != WIO_OPENED) return refuse(info, code);
    if (info.format->samplesPerSec > HIGHEST_SAMPLE_RATE) {
        wioFileClose(&info);
        showMessage(MESSAGE_ERROR, RATE_TOO_HIGH_TEXT);
        return 1;
    }
    acceptWaveFormat(*info.format);
    FILE* csv = fileOpen(csvPath, "w");
    if (!csv) {
        wioFileClose(&info);
        showMessage(MESSAGE_ERROR, "Cannot " + csvPath);
        return 1;
    }
    std::fprintf(csv, "block,time_s,loudness,frequency_hz,amplitude\n");

    int analysed = 0;
    if (setupFrequencyAnalysis() && openFTFile(FT_UPDATE)) {
        if (openHiresFTFile(FT_UPDATE)) {
            fileSeek(info.file, info.dataOffset, SEEK_SET);
            WaveSource source{&info, info.dataSamples};
            analysed = analyseSource(readWaveSource, &source, writeBlockRows, csv);
            closeHiresFTFile(1);
        }
        closeFTFile(1);
    }
    releaseFrequencyAnalysis();
    wioFileClose(&info);
    int written = std::fclose(csv) == 0;
    if (analysed && !written) showMessage(MESSAGE_ERROR, "Cannot " + csvPath);
    if (analysed && written) {
        const AnalysisGeometry& g = analysisGeometry;
        std::printf("File: %s\n", path.c_str());
        std::printf("Blocks: %u of %u samples (%.6f s)\n", song.blockCount, g.blockSamples, g.sampleBlockDuration);
        std::printf("Analysed: %.3f s\n", songDuration());
        std::printf("Levels: %d (group of %u blocks), pitch bins: %d, semitone divisions: %g\n", g.levels, g.group,
                    g.pitchBins, g.semitoneDivisions);
        std::printf("Frequency range: %.1f to %.1f Hz\n", g.lowestAnalysed, g.highestAnalysed);
        std::printf("FT table: %s\n", csvPath.c_str());
    }
    closeSong();
    return analysed && written ? 0 : 1;
}
