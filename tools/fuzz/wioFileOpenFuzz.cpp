// Fuzz target for the wave reader: each input is written to a memory file, opened with
// wioFileOpen (the bits of the first byte answer the over-long chunk questions Yes or No in
// turn) and, when it opens, up to 1 MiB of it is downmixed as the opening worker would read
// it. Built for libFuzzer with sanitizers, and into the replay driver that the tests run.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <sys/mman.h>
#include <unistd.h>
#include <vector>

#include "fuzzSupport.h"
#include "audio/waveFile.h"
#include "platform/files.h"
#include "platform/ui.h"

static const uint32_t MAX_OUTPUT_BYTES = 1 << 20;
static const size_t GUARD_BYTES = 64;
static const uint8_t GUARD = 0xA5;

struct FuzzInput {
    std::string path;       // what wioFileOpen is given
    int descriptor = -1;    // a memory file, rewritten for each input without touching a disk
};
static FuzzInput fuzzInput;

static void removeInput() {
    if (fuzzInput.descriptor < 0) std::remove(fuzzInput.path.c_str());
}

static const FuzzInput& openFuzzInput() {
    if (!fuzzInput.path.empty()) return fuzzInput;
    int memory = memfd_create("wioFileOpenFuzz", 0);
    if (memory >= 0) {
        fuzzInput.descriptor = memory;
        fuzzInput.path = "/proc/self/fd/" + std::to_string(memory);
        return fuzzInput;
    }
    std::string pattern = (std::filesystem::temp_directory_path() / "wioFileOpenFuzz-XXXXXX").string();
    std::vector<char> name(pattern.begin(), pattern.end());
    name.push_back('\0');
    int descriptor = mkstemp(name.data());
    if (descriptor < 0) {
        std::fprintf(stderr, "wioFileOpenFuzz: cannot make a temporary file\n");
        std::abort();
    }
    close(descriptor);
    fuzzInput.path = name.data();
    std::atexit(removeInput);
    return fuzzInput;
}

// 1 when the file at input.path now holds exactly the input.
static int storeInput(const FuzzInput& input, const uint8_t* data, size_t size) {
    if (input.descriptor >= 0) {
        if (ftruncate(input.descriptor, 0) != 0) return 0;
        return size == 0 || pwrite(input.descriptor, data, size, 0) == ssize_t(size) ? 1 : 0;
    }
    FILE* file = std::fopen(input.path.c_str(), "wb");
    if (!file) return 0;
    size_t written = size ? std::fwrite(data, 1, size, file) : 0;
    return std::fclose(file) == 0 && written == size ? 1 : 0;
}

// A broken promise of the reader is a finding: stop here so the fuzzer keeps the input.
static void expect(bool holds, const char* what) { fuzzExpect(holds, "wioFileOpenFuzz", what); }

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const FuzzInput& input = openFuzzInput();
    if (!storeInput(input, data, size)) return 0;
    const std::string& path = input.path;

    clearUiCalls();
    uint8_t answerBits = size ? data[0] : 0;
    std::vector<int> answers;
    for (int bit = 0; bit < 8; bit++) answers.push_back(answerBits >> bit & 1 ? ANSWER_YES : ANSWER_NO);
    presetAnswers(answers);

    WaveReadInfo info{};
    uint32_t code = wioFileOpen(&info, path, 0);
    if (code != WIO_OPENED) {
        expect(info.file == nullptr && info.format == nullptr, "a refused file was left open");
        expect(!waveOpenMessage(code).empty(), "a refusal without a message");
        return 0;
    }
    expect(info.file != nullptr && info.format != nullptr, "opened without a file or a format");
    expect(uint64_t(info.dataOffset) + info.dataBytes <= size, "the data reach past the end of the file");
    uint32_t blockAlign = info.format->blockAlign;
    expect(uint64_t(info.dataSamples) * blockAlign <= info.dataBytes, "more frames than the data hold");
    expect(blockAlign != 0 || info.dataSamples == 0, "frames without a frame size");
    if (info.dataSizeOffset != WAVE_UNKNOWN)
        expect(info.dataSizeOffset + 4 == info.dataOffset, "data size field misplaced");
    if (info.factValueOffset != WAVE_UNKNOWN)
        expect(uint64_t(info.factValueOffset) + 4 <= size, "fact value beyond the file");
    uint32_t check = checkWaveFileFormat(info);
    expect(waveOpenMessage(check).empty() == (check == WIO_OPENED), "format check and message disagree");

    // Every format is downmixed, refused ones too: the destination must hold whatever comes.
    static std::vector<uint8_t> buffer(MAX_OUTPUT_BYTES + GUARD_BYTES);
    uint32_t outputBytes = std::min(info.dataBytes, MAX_OUTPUT_BYTES);
    std::fill(buffer.begin() + outputBytes, buffer.begin() + outputBytes + GUARD_BYTES, GUARD);
    if (fileSeek(info.file, info.dataOffset, SEEK_SET) == 0) {
        uint32_t filled = downmixFrames(info.file, *info.format, buffer.data(), outputBytes);
        expect(filled <= outputBytes, "downmix reports more than was asked");
        for (size_t i = 0; i < GUARD_BYTES; i++)
            expect(buffer[outputBytes + i] == GUARD, "downmix wrote past the end");
    }
    expect(wioFileClose(&info) == 0 && info.file == nullptr && info.format == nullptr, "close left something");
    return 0;
}
