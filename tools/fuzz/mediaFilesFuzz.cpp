// Fuzz target for the playback devices' readers: each input is read both as a wave file's head
// and as a MIDI file. A wave it takes must have a playable format and data inside the file; a
// MIDI file it takes must have a length. Built for libFuzzer with sanitizers, and with
// MEDIA_FILES_FUZZ_REPLAY into the replay driver that the tests run.
#include <cstdint>
#include <cstring>
#include <vector>

#include "fuzzSupport.h"
#include "platform/mediaFiles.h"

static void expect(bool holds, const char* what) { fuzzExpect(holds, "mediaFilesFuzz", what); }

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // A copy of exactly size bytes, so that a read past the end is seen by the sanitizers.
    std::vector<uint8_t> bytes(data, data + size);
    MediaWaveInfo wave{};
    if (parseMediaWaveInfo(bytes.data(), bytes.size(), bytes.size(), &wave)) {
        expect(wave.bits == 8 || wave.bits == 16, "a sample size the device cannot play");
        expect(wave.channels >= 1 && wave.channels <= 16 && wave.rate > 0, "a format without frames");
        expect(uint64_t(wave.dataOffset) + wave.dataBytes <= size, "data beyond the file");
        expect(wave.dataBytes % (wave.channels * wave.bits / 8) == 0, "data of part of a frame");
    }
    uint32_t milliseconds = 0;
    if (parseMidiFileDuration(bytes.data(), bytes.size(), &milliseconds)) expect(milliseconds < 4000000000u, "no length");
    return 0;
}

#ifdef MEDIA_FILES_FUZZ_REPLAY
// The seeds for the shared replay driver: mediaFilesFuzzReplay [runs] | --write-seeds DIR | FILE...
#include "fuzzReplay.h"

using Bytes = std::vector<uint8_t>;

static void put(Bytes& b, std::initializer_list<uint8_t> bytes) { b.insert(b.end(), bytes); }

static std::vector<Bytes> seeds() {
    Bytes wave;
    put(wave, {'R', 'I', 'F', 'F', 44, 0, 0, 0, 'W', 'A', 'V', 'E', 'f', 'm', 't', ' ', 16, 0, 0, 0, 1, 0, 1, 0,
               0x44, 0xAC, 0, 0, 0x88, 0x58, 1, 0, 2, 0, 16, 0, 'd', 'a', 't', 'a', 8, 0, 0, 0, 1, 2, 3, 4, 5, 6, 7, 8});
    Bytes midi;
    put(midi, {'M', 'T', 'h', 'd', 0, 0, 0, 6, 0, 1, 0, 2, 1, 0, 'M', 'T', 'r', 'k', 0, 0, 0, 11, 0, 0xFF, 0x51, 3,
               7, 0xA1, 0x20, 0, 0xFF, 0x2F, 0, 'M', 'T', 'r', 'k', 0, 0, 0, 20, 0, 0xF0, 1, 0xF7, 0, 0xC0, 52, 0, 0x90,
               69, 100, 0x82, 0, 69, 0, 1, 0xFF, 0x2F, 0});
    Bytes smpte = midi;
    smpte[12] = 0xE7;
    smpte[13] = 40;
    return {wave, midi, smpte, Bytes{}};
}

int main(int argc, char** argv) { return runFuzzReplay(argc, argv, seeds(), LLVMFuzzerTestOneInput, 20000); }
#endif
