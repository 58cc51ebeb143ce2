// Throughput of the complex-double (VCD_FFT) and real-float (VF_FFT) forward transforms for
// 256 to 65,536 points, each beside FFTW's fastest plan for the same transform, with a table
// of the time ratios at the end. Run a Release build: build/bench/fftBench.
#include <benchmark/benchmark.h>
#include <fftw3.h>

#include <cstdio>
#include <map>
#include <random>
#include <string>

#include "analysis/vector/fft.h"
#include "analysis/vector/vectorTable.h"

static void fillRandom(double* x, size_t count) {
    std::mt19937 generator(7);
    std::uniform_real_distribution<double> value(-1, 1);
    for (size_t i = 0; i < count; i++) x[i] = value(generator);
}

static void fillRandom(float* x, size_t count) {
    std::mt19937 generator(7);
    std::uniform_real_distribution<float> value(-1, 1);
    for (size_t i = 0; i < count; i++) x[i] = value(generator);
}

static void setThroughput(benchmark::State& state, unsigned n) {
    state.SetItemsProcessed(int64_t(state.iterations()) * n);
    state.counters["points"] = n;
}

static void VCD_FFT_forward(benchmark::State& state) {
    unsigned n = unsigned(state.range(0));
    dComplex* x = VCD_vector(n);
    dComplex* y = VCD_vector(n);
    fillRandom(&x[0].Re, 2 * size_t(n));
    for (auto _ : state) {
        VCD_FFT(y, x, n, 1);
        benchmark::DoNotOptimize(y);
        benchmark::ClobberMemory();
    }
    setThroughput(state, n);
    V_free(y);
    V_free(x);
}

static void FFTW_complexDouble(benchmark::State& state) {
    unsigned n = unsigned(state.range(0));
    fftw_complex* x = fftw_alloc_complex(n);
    fftw_complex* y = fftw_alloc_complex(n);
    // FFTW's backward sign is exp(+2*pi*i*j*k/n), the library's forward transform.
    fftw_plan plan = fftw_plan_dft_1d(int(n), x, y, FFTW_BACKWARD, FFTW_MEASURE);
    fillRandom(&x[0][0], 2 * size_t(n));
    for (auto _ : state) {
        fftw_execute(plan);
        benchmark::DoNotOptimize(y);
        benchmark::ClobberMemory();
    }
    setThroughput(state, n);
    fftw_destroy_plan(plan);
    fftw_free(y);
    fftw_free(x);
}

static void VF_FFT_forward(benchmark::State& state) {
    unsigned n = unsigned(state.range(0));
    float* x = VF_vector(n);
    float* y = VF_vector(n);
    fComplex* scratch = VCF_vector(n / 2);
    fillRandom(x, n);
    for (auto _ : state) {
        VF_FFT(y, x, n, 1, scratch);
        benchmark::DoNotOptimize(y);
        benchmark::ClobberMemory();
    }
    setThroughput(state, n);
    V_free(scratch);
    V_free(y);
    V_free(x);
}

static void FFTW_realFloat(benchmark::State& state) {
    unsigned n = unsigned(state.range(0));
    float* x = fftwf_alloc_real(n);
    fftwf_complex* y = fftwf_alloc_complex(n / 2 + 1);
    fftwf_plan plan = fftwf_plan_dft_r2c_1d(int(n), x, y, FFTW_MEASURE);
    fillRandom(x, n);
    for (auto _ : state) {
        fftwf_execute(plan);
        benchmark::DoNotOptimize(y);
        benchmark::ClobberMemory();
    }
    setThroughput(state, n);
    fftwf_destroy_plan(plan);
    fftwf_free(y);
    fftwf_free(x);
}

BENCHMARK(VCD_FFT_forward)->RangeMultiplier(2)->Range(1 << 8, 1 << 16)->Unit(benchmark::kMicrosecond);
BENCHMARK(FFTW_complexDouble)->RangeMultiplier(2)->Range(1 << 8, 1 << 16)->Unit(benchmark::kMicrosecond);
BENCHMARK(VF_FFT_forward)->RangeMultiplier(2)->Range(1 << 8, 1 << 16)->Unit(benchmark::kMicrosecond);
BENCHMARK(FFTW_realFloat)->RangeMultiplier(2)->Range(1 << 8, 1 << 16)->Unit(benchmark::kMicrosecond);

// The console output, followed by a table of our time over FFTW's at each size (the best of
// the repetitions when --benchmark_repetitions is given).
class RatioReporter : public benchmark::ConsoleReporter {
public:
    void ReportRuns(const std::vector<Run>& runs) override {
        ConsoleReporter::ReportRuns(runs);
        for (const Run& run : runs) {
            if (run.error_occurred || run.run_type != Run::RT_Iteration) continue;
            std::string name = run.run_name.function_name;
            long n = std::stol(run.run_name.args);
            double microseconds = run.GetAdjustedRealTime();
            auto found = times[name].find(n);
            if (found == times[name].end() || microseconds < found->second) times[name][n] = microseconds;
        }
    }

    void Finalize() override {
        ConsoleReporter::Finalize();
        printTable("complex double", "VCD_FFT_forward", "FFTW_complexDouble");
        printTable("real float", "VF_FFT_forward", "FFTW_realFloat");
    }

private:
    void printTable(const char* title, const std::string& ours, const std::string& fftw) {
        std::printf("\n%s: time per transform, microseconds\n%8s %20s %12s %8s\n", title, "points", ours.c_str(),
                    "FFTW", "ratio");
        for (const auto& [n, microseconds] : times[ours]) {
            auto other = times[fftw].find(n);
            if (other == times[fftw].end()) continue;
            std::printf("%8ld %20.3f %12.3f %8.2f\n", n, microseconds, other->second, microseconds / other->second);
        }
        std::fflush(stdout);
    }

    std::map<std::string, std::map<long, double>> times;   // benchmark -> points -> best time
};

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
    RatioReporter reporter;
    benchmark::RunSpecifiedBenchmarks(&reporter);
    benchmark::Shutdown();
    return 0;
}
