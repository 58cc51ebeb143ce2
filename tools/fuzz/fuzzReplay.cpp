// The replay driver shared by the fuzz targets.
#include "fuzzReplay.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <string>

// xorshift64*: the same mutations on every machine and every run.
struct Random {
    uint64_t state;   // never 0
    uint64_t next() {
        state ^= state >> 12;
        state ^= state << 25;
        state ^= state >> 27;
        return state * 2685821657736338717ULL;
    }
    size_t below(size_t n) { return n ? size_t(next() % n) : 0; }
};

static FuzzBytes mutate(const FuzzBytes& seed, Random& random) {
    static const uint32_t interesting[] = {0, 1, 2, 3, 4, 8, 12, 15, 16, 17, 18, 0x7F, 0x80, 0xFF, 0x100, 0xFFFF,
                                           0x10000, 0x10001, 0x7FFFFFFF, 0x80000000, 0xFFFFFFF0, 0xFFFFFFFE,
                                           0xFFFFFFFF};
    FuzzBytes b = seed;
    int steps = 1 + int(random.below(4));
    for (int s = 0; s < steps; s++) {
        switch (random.below(7)) {
        case 0:
            if (!b.empty()) b[random.below(b.size())] ^= uint8_t(1 << random.below(8));
            break;
        case 1:
            if (!b.empty()) b[random.below(b.size())] = uint8_t(random.next());
            break;
        case 2:
            if (b.size() >= 4) {
                size_t at = random.below(b.size() - 3);
                if (random.below(2)) at &= ~size_t(3);   // fields mostly sit on 4-byte boundaries
                uint32_t v = interesting[random.below(sizeof interesting / sizeof interesting[0])];
                for (int i = 0; i < 4; i++) b[at + i] = uint8_t(v >> (8 * i));
            }
            break;
        case 3:
            b.resize(random.below(b.size() + 1));
            break;
        case 4: {
            size_t at = random.below(b.size() + 1);
            FuzzBytes extra(1 + random.below(16));
            for (uint8_t& x : extra) x = uint8_t(random.next());
            b.insert(b.begin() + long(at), extra.begin(), extra.end());
            break;
        }
        case 5:
            if (!b.empty()) {
                size_t from = random.below(b.size());
                size_t count = 1 + random.below(std::min<size_t>(32, b.size() - from));
                FuzzBytes slice(b.begin() + long(from), b.begin() + long(from + count));
                b.insert(b.begin() + long(random.below(b.size() + 1)), slice.begin(), slice.end());
            }
            break;
        default:
            if (!b.empty()) {
                size_t from = random.below(b.size());
                size_t count = 1 + random.below(std::min<size_t>(16, b.size() - from));
                b.erase(b.begin() + long(from), b.begin() + long(from + count));
            }
            break;
        }
    }
    return b;
}

static int writeSeeds(const std::vector<FuzzBytes>& seeds, const std::string& folder, const char* suffix) {
    for (size_t i = 0; i < seeds.size(); i++) {
        std::string path = folder + "/seed-" + std::to_string(i) + suffix;
        std::ofstream out(path, std::ios::binary | std::ios::trunc);
        out.write(reinterpret_cast<const char*>(seeds[i].data()), std::streamsize(seeds[i].size()));
        if (!out) {
            std::fprintf(stderr, "cannot write %s\n", path.c_str());
            return 1;
        }
    }
    std::printf("%zu seeds written to %s\n", seeds.size(), folder.c_str());
    return 0;
}

int runFuzzReplay(int argc, char** argv, const std::vector<FuzzBytes>& seeds, FuzzTarget target, long defaultRuns,
                  const char* seedSuffix) {
    if (argc == 3 && std::strcmp(argv[1], "--write-seeds") == 0) return writeSeeds(seeds, argv[2], seedSuffix);
    if (argc >= 2 && !(argv[1][0] >= '0' && argv[1][0] <= '9')) {
        for (int i = 1; i < argc; i++) {
            std::ifstream in(argv[i], std::ios::binary);
            if (!in) {
                std::fprintf(stderr, "cannot read %s\n", argv[i]);
                return 1;
            }
            FuzzBytes b((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
            target(b.data(), b.size());
        }
        std::printf("%d files replayed\n", argc - 1);
        return 0;
    }
    if (seeds.empty()) return 1;
    long runs = argc >= 2 ? std::strtol(argv[1], nullptr, 10) : defaultRuns;
    Random random{0x9E3779B97F4A7C15ULL};
    long done = 0;
    for (const FuzzBytes& seed : seeds) {
        target(seed.data(), seed.size());
        done++;
    }
    for (; done < runs; done++) {
        FuzzBytes input = mutate(seeds[random.below(seeds.size())], random);
        // Mutations of mutations reach further from the seeds.
        if (random.below(4) == 0) input = mutate(input, random);
        target(input.data(), input.size());
    }
    std::printf("%ld inputs replayed\n", done);
    return 0;
}
