// Frequency table creation on a generated melody (44,100 Hz, 16-bit, mono), chunk by chunk as a
// file is opened, with the FT and Hires FT blocks stored in working files, with the default
// settings (pitch range 1), enhanced pitch accuracy, and wave editing disabled (no Hires FT
// blocks, which shows the analysis' own memory apart from the Hires buffer): the real-time factor
// (seconds of audio per second of processor time, on the one core the pass runs on), where the
// time goes, and the peak memory. Each case runs in a child process of its own, so that its
// peak memory is its own; 60 s against 600 s shows that memory stops growing with the window.
//
//   analysisBench [SECONDS ...]    (default: 60 600)
#include <sys/resource.h>
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
#include "analysis/chunkedAnalysis.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/recognitionOptions.h"
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

static double processorSeconds() {
    timespec t;
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &t);
    return double(t.tv_sec) + double(t.tv_nsec) * 1e-9;
}

static double wallSeconds() {
    timespec t;
    clock_gettime(CLOCK_MONOTONIC, &t);
    return double(t.tv_sec) + double(t.tv_nsec) * 1e-9;
}

static uint32_t readMelody(void* context, uint8_t* destination, uint32_t count) {
    MelodySource& s = *static_cast<MelodySource*>(context);
    uint32_t n = uint32_t(count < s.samplesLeft ? count : s.samplesLeft);
    double start = processorSeconds();
    s.generator.fill16(destination, n);
    s.generatorSeconds += processorSeconds() - start;
    s.samplesLeft -= n;
    return n;
}

// One case, in the child: prints one line of results; the exit status tells success.
enum BenchSettings { DEFAULT_SETTINGS, ENHANCED_ACCURACY, NO_WAVE_EDITING };
static const char* const SETTINGS_NAMES[] = {"default", "enhanced", "no-wave-editing"};

static int runCase(double seconds, int settings, const std::string& folder) {
    setSharedBasePath(folder);
    makeFolder(sharedFilePath(""));
    generalSettings.pitchRange = PITCH_RANGE_LOW_TO_MID;
    generalSettings.enhancedPitchAccuracy = settings == ENHANCED_ACCURACY;
    generalSettings.disableWaveEditing = settings == NO_WAVE_EDITING;
    globalSettings.boostSpeed = false;
    song.waveFormat = SongWaveFormat{1, 1, 44100, 88200, 2, 16};
    if (!setupFrequencyAnalysis() || !openFTFile(FT_UPDATE) || !openHiresFTFile(FT_UPDATE)) return 1;
    MelodySource source{MelodyGenerator{}, uint64_t(seconds * 44100), 0.0};
    ChunkedAnalysisTimes times{};
    double wall = wallSeconds();
    double start = processorSeconds();
    int analysed = analyseSource(readMelody, &source, nullptr, nullptr, &times);
    double cpu = processorSeconds() - start - source.generatorSeconds;
    wall = wallSeconds() - wall;
    closeHiresFTFile(1);
    closeFTFile(1);
    int64_t ftBytes = fileSize(sharedFilePath("CS.ft")), hiresBytes = fileSize(sharedFilePath("CS.ft+"));
    uint32_t blocks = song.blockCount;
    releaseFrequencyAnalysis();
    closeSong();
    if (!analysed) return 1;
    rusage usage;
    getrusage(RUSAGE_SELF, &usage);
    const AnalysisGeometry& g = analysisGeometry;
    std::printf("%-15s %4.0f s  L=%d G=%-3u blocks %7u  %6.2f s cpu  %6.1fx real time  (spectrogram %5.2f s, tables "
                "%5.2f s, storing %5.2f s; wall %6.2f s)  peak %6.1f MB  CS.ft %5.1f MB  CS.ft+ %6.1f MB\n",
                SETTINGS_NAMES[settings], seconds, g.levels, g.group, blocks, cpu, seconds / cpu,
                times.spectrogram, times.tables, times.storing, wall, double(usage.ru_maxrss) / 1024.0,
                double(ftBytes) / 1e6, double(hiresBytes) / 1e6);
    std::fflush(stdout);
    return 0;
}

int main(int argc, char** argv) {
    std::vector<double> lengths;
    for (int i = 1; i < argc; i++) lengths.push_back(std::atof(argv[i]));
    if (lengths.empty()) lengths = {60.0, 600.0};
    std::string benchFolder = makeBenchFolder("analysisBench");
    const char* folder = benchFolder.c_str();
    int failures = 0;
    for (int settings : {DEFAULT_SETTINGS, ENHANCED_ACCURACY, NO_WAVE_EDITING}) {
        for (double seconds : lengths) {
            pid_t child = fork();
            if (child == 0) _exit(runCase(seconds, settings, folder));
            int status = 0;
            waitpid(child, &status, 0);
            if (!WIFEXITED(status) || WEXITSTATUS(status) != 0) {
                std::printf("%s %.0f s: failed\n", SETTINGS_NAMES[settings], seconds);
                failures++;
            }
        }
    }
    return failures ? 1 : 0;
}
