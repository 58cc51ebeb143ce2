// Note recognition on the generated melody of the frequency-table benchmark (44,100 Hz, 16-bit,
// mono), analysed chunk by chunk with the FT and Hires FT blocks stored and recognition
// following the analysis as in a whole-song analysis, with the default settings: recognition's
// processor time per second of audio, and the real-time factor of analysis and recognition
// together (seconds of audio per second of processor time on the one core the pass runs on).
// Each length runs in a child process of its own.
//
//   recognitionBench [SECONDS ...]    (default: 60)
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <string>
#include <vector>

#include "benchFolder.h"
#include "analysis/analysisGeometry.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/recognitionOptions.h"
#include "analysis/wholeSongAnalysis.h"
#include "notes/noteList.h"
#include "platform/files.h"
#include "shell/closeSong.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"
#include "tests/analysis/signalGenerator.h"

struct MelodySource {
    MelodyGenerator generator;
    uint64_t samplesLeft;
    double generatorSeconds;   // processor time spent making the melody, not analysing it
};

static double processorSeconds() { return double(std::clock()) / CLOCKS_PER_SEC; }

static uint32_t readMelody(void* context, uint8_t* destination, uint32_t count) {
    MelodySource& s = *static_cast<MelodySource*>(context);
    uint32_t n = uint32_t(count < s.samplesLeft ? count : s.samplesLeft);
    double start = processorSeconds();
    s.generator.fill16(destination, n);
    s.generatorSeconds += processorSeconds() - start;
    s.samplesLeft -= n;
    return n;
}

static int runCase(double seconds, const std::string& folder) {
    setSharedBasePath(folder);
    makeFolder(sharedFilePath(""));
    generalSettings.pitchRange = PITCH_RANGE_LOW_TO_MID;
    song.waveFormat = SongWaveFormat{1, 1, 44100, 88200, 2, 16};
    if (!setupFrequencyAnalysis() || !openFTFile(FT_UPDATE) || !openHiresFTFile(FT_UPDATE)) return 1;
    MelodySource source{MelodyGenerator{}, uint64_t(seconds * 44100), 0.0};
    ChunkedAnalysisTimes times{};
    double recognition = 0.0;
    double start = processorSeconds();
    int analysed = analyseWithRecognition(readMelody, &source, nullptr, nullptr, &times, &recognition);
    double total = processorSeconds() - start - source.generatorSeconds;
    closeHiresFTFile(1);
    closeFTFile(1);
    int notes = noteList.count;
    uint32_t blocks = song.blockCount;
    releaseFrequencyAnalysis();
    closeSong();
    if (!analysed) return 1;
    double analysis = times.spectrogram + times.tables + times.storing;
    std::printf("%4.0f s  blocks %6u  notes %4d  analysis %6.2f s cpu  recognition %6.3f s cpu (%5.1f ms per second "
                "of audio)  together %6.2f s cpu: %5.1fx real time\n",
                seconds, blocks, notes, analysis, recognition, 1000.0 * recognition / seconds, total, seconds / total);
    std::fflush(stdout);
    return 0;
}

int main(int argc, char** argv) {
    std::vector<double> lengths;
    for (int i = 1; i < argc; i++) lengths.push_back(std::atof(argv[i]));
    if (lengths.empty()) lengths = {60.0};
    std::string benchFolder = makeBenchFolder("recognitionBench");
    const char* folder = benchFolder.c_str();
    int failures = 0;
    for (double seconds : lengths) {
        pid_t child = fork();
        if (child == 0) _exit(runCase(seconds, folder));
        int status = 0;
        waitpid(child, &status, 0);
        if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
            std::printf("%.0f s: failed\n", seconds);
            failures++;
        }
    }
    return failures ? 1 : 0;
}
