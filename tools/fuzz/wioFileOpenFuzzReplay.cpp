// Replays the wave reader's fuzz target without libFuzzer: over seed files built here and
// deterministic mutations of them (the test run uses this), over given files (reproducing
// a finding), or writes the seeds into a folder as the libFuzzer corpus.
//   wioFileOpenFuzzReplay [runs]               seeds, then mutations, runs in all (20000)
//   wioFileOpenFuzzReplay --write-seeds DIR    one file per seed
//   wioFileOpenFuzzReplay FILE...              each file once
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

using Bytes = std::vector<uint8_t>;

static void put16(Bytes& b, uint16_t v) {
    b.push_back(uint8_t(v));
    b.push_back(uint8_t(v >> 8));
}

static void put32(Bytes& b, uint32_t v) {
    for (int i = 0; i < 4; i++) b.push_back(uint8_t(v >> (8 * i)));
}

static void putTag(Bytes& b, const char* tag) { b.insert(b.end(), tag, tag + 4); }

static Bytes format(uint16_t tag, uint16_t channels, uint32_t rate, uint16_t bits, uint16_t extra = 0) {
    uint16_t align = uint16_t(channels * bits / 8);
    Bytes b;
    put16(b, tag);
    put16(b, channels);
    put32(b, rate);
    put32(b, rate * align);
    put16(b, align);
    put16(b, bits);
    if (tag != 1) {
        put16(b, extra);
        b.resize(b.size() + extra, 0x11);
    }
    return b;
}

static void chunk(Bytes& b, const char* id, const Bytes& body, int64_t claimed = -1) {
    putTag(b, id);
    put32(b, uint32_t(claimed < 0 ? int64_t(body.size()) : claimed));
    b.insert(b.end(), body.begin(), body.end());
    if (body.size() & 1) b.push_back(0);
}

static Bytes riff(const Bytes& chunks, int64_t riffSize = -1) {
    Bytes b;
    putTag(b, "RIFF");
    put32(b, uint32_t(riffSize < 0 ? int64_t(chunks.size() + 4) : riffSize));
    putTag(b, "WAVE");
    b.insert(b.end(), chunks.begin(), chunks.end());
    return b;
}

static Bytes ramp(size_t n) {
    Bytes b(n);
    for (size_t i = 0; i < n; i++) b[i] = uint8_t(i * 37 + 11);
    return b;
}

static Bytes value32(uint32_t v) {
    Bytes b;
    put32(b, v);
    return b;
}

static std::vector<Bytes> seeds() {
    std::vector<Bytes> all;
    auto add = [&](const Bytes& chunks, int64_t riffSize = -1) { all.push_back(riff(chunks, riffSize)); };
    Bytes c;
    chunk(c, "fmt ", format(1, 1, 8000, 8));
    chunk(c, "data", ramp(64));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(1, 2, 44100, 16));
    chunk(c, "data", ramp(256));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(1, 1, 22050, 16));
    chunk(c, "fact", value32(20));
    chunk(c, "data", ramp(80));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(3, 1, 44100, 32, 0));
    chunk(c, "data", ramp(64));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(3, 2, 44100, 32, 0));
    chunk(c, "fact", value32(8));
    chunk(c, "data", ramp(64));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(1, 2, 8000, 8));
    chunk(c, "data", ramp(40), 400);   // over-long and cut off
    add(c);
    c.clear();
    chunk(c, "fmt ", format(1, 1, 8000, 16));
    chunk(c, "data", ramp(40));
    add(c, 0);   // RIFF size never filled in
    c.clear();
    chunk(c, "LIST", ramp(5));
    chunk(c, "fmt ", format(1, 3, 11025, 8));
    chunk(c, "data", {});
    chunk(c, "data", ramp(33));
    chunk(c, "id3 ", ramp(7));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(0xFFFE, 4, 48000, 16, 22));
    chunk(c, "fact", value32(1000));
    chunk(c, "data", ramp(128));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(1, 2, 44100, 24));
    chunk(c, "data", ramp(60));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(1, 17, 8000, 8));
    chunk(c, "data", ramp(68));
    add(c);
    c.clear();
    chunk(c, "fmt ", format(1, 1, 8000, 8));
    chunk(c, "fact", value32(0xFFFFFFFF));
    chunk(c, "data", ramp(48));
    add(c);   // laid out like the working file CS.fw
    c.clear();
    chunk(c, "fmt ", format(1, 2, 8000, 16));
    chunk(c, "huge", {}, 0xFFFFFFFF);
    add(c);
    Bytes junkFirst;
    chunk(junkFirst, "JUNK", ramp(9));
    Bytes wave = all.front();
    junkFirst.insert(junkFirst.end(), wave.begin(), wave.end());
    all.push_back(junkFirst);
    return all;
}

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

static Bytes mutate(const Bytes& seed, Random& random) {
    static const uint32_t interesting[] = {0, 1, 2, 3, 4, 8, 16, 17, 18, 0x7F, 0x80, 0xFF, 0xFFFF, 0x10000, 0x10001,
                                           0x7FFFFFFF, 0x80000000, 0xFFFFFFF0, 0xFFFFFFFE, 0xFFFFFFFF};
    Bytes b = seed;
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
            Bytes extra(1 + random.below(16));
            for (uint8_t& x : extra) x = uint8_t(random.next());
            b.insert(b.begin() + long(at), extra.begin(), extra.end());
            break;
        }
        case 5:
            if (!b.empty()) {
                size_t from = random.below(b.size());
                size_t count = 1 + random.below(std::min<size_t>(32, b.size() - from));
                Bytes slice(b.begin() + long(from), b.begin() + long(from + count));
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

static int writeSeeds(const std::string& folder) {
    std::vector<Bytes> all = seeds();
    for (size_t i = 0; i < all.size(); i++) {
        std::string path = folder + "/seed-" + std::to_string(i) + ".wav";
        std::ofstream out(path, std::ios::binary | std::ios::trunc);
        out.write(reinterpret_cast<const char*>(all[i].data()), std::streamsize(all[i].size()));
        if (!out) {
            std::fprintf(stderr, "cannot write %s\n", path.c_str());
            return 1;
        }
    }
    std::printf("%zu seeds written to %s\n", all.size(), folder.c_str());
    return 0;
}

int main(int argc, char** argv) {
    if (argc == 3 && std::strcmp(argv[1], "--write-seeds") == 0) return writeSeeds(argv[2]);
    if (argc >= 2 && !(argv[1][0] >= '0' && argv[1][0] <= '9')) {
        for (int i = 1; i < argc; i++) {
            std::ifstream in(argv[i], std::ios::binary);
            if (!in) {
                std::fprintf(stderr, "cannot read %s\n", argv[i]);
                return 1;
            }
            Bytes b((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
            LLVMFuzzerTestOneInput(b.data(), b.size());
        }
        std::printf("%d files replayed\n", argc - 1);
        return 0;
    }
    long runs = argc >= 2 ? std::strtol(argv[1], nullptr, 10) : 20000;
    std::vector<Bytes> all = seeds();
    Random random{0x9E3779B97F4A7C15ULL};
    long done = 0;
    for (const Bytes& seed : all) {
        LLVMFuzzerTestOneInput(seed.data(), seed.size());
        done++;
    }
    for (; done < runs; done++) {
        Bytes input = mutate(all[random.below(all.size())], random);
        // Mutations of mutations reach further from the seeds.
        if (random.below(4) == 0) input = mutate(input, random);
        LLVMFuzzerTestOneInput(input.data(), input.size());
    }
    std::printf("%ld inputs replayed\n", done);
    return 0;
}
