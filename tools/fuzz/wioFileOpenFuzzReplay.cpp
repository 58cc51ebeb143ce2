// The seeds of the wave reader's fuzz target, for the shared replay driver (fuzzReplay.h):
// wioFileOpenFuzzReplay [runs] | --write-seeds DIR | FILE...
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

#include "fuzzReplay.h"
#include "fuzzSupport.h"

using Bytes = FuzzBytes;

static void putTag(Bytes& b, const char* tag) { b.insert(b.end(), tag, tag + 4); }

static Bytes format(uint16_t tag, uint16_t channels, uint32_t rate, uint16_t bits, uint16_t extra = 0) {
    uint16_t align = uint16_t(channels * bits / 8);
    Bytes b;
    fuzzPut16(b, tag);
    fuzzPut16(b, channels);
    fuzzPut32(b, rate);
    fuzzPut32(b, rate * align);
    fuzzPut16(b, align);
    fuzzPut16(b, bits);
    if (tag != 1) {
        fuzzPut16(b, extra);
        b.resize(b.size() + extra, 0x11);
    }
    return b;
}

static void chunk(Bytes& b, const char* id, const Bytes& body, int64_t claimed = -1) {
    putTag(b, id);
    fuzzPut32(b, uint32_t(claimed < 0 ? int64_t(body.size()) : claimed));
    b.insert(b.end(), body.begin(), body.end());
    if (body.size() & 1) b.push_back(0);
}

static Bytes riff(const Bytes& chunks, int64_t riffSize = -1) {
    Bytes b;
    putTag(b, "RIFF");
    fuzzPut32(b, uint32_t(riffSize < 0 ? int64_t(chunks.size() + 4) : riffSize));
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
    fuzzPut32(b, v);
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

int main(int argc, char** argv) {
    return runFuzzReplay(argc, argv, seeds(), LLVMFuzzerTestOneInput, 20000, ".wav");
}
