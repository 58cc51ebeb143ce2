// Fuzz target for the instrument definitions file: each input becomes a CSInst.dat in a
// folder of its own and is loaded as at start-up. A file the loader refuses must leave the
// table empty with a message; a file it takes must hold a sound table, save to a file of the
// same size, and load back from that file to the same table and the same bytes again. Built
// for libFuzzer with sanitizers, and with INSTRUMENT_FILE_FUZZ_REPLAY into the replay driver
// that the tests run.
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "fuzzSupport.h"
#include "analysis/instrumentDefinitions.h"
#include "platform/ui.h"

static std::string folder;   // the target's own temporary folder, ending in "/"

// A broken promise of the loader is a finding: stop here so the fuzzer keeps the input.
static void expect(bool holds, const char* what) { fuzzExpect(holds, "instrumentFileFuzz", what); }

static void useOwnFolder() {
    if (!folder.empty()) return;
    folder = fuzzFolder("instrumentFileFuzz");
    setUiEcho(false);
}

static void expectSoundTable() {
    const std::vector<InstrumentDefinition>& table = instrumentDefinitions.definitions;
    expect(table.size() <= size_t(MAX_CS_INSTRUMENTS), "more definitions than the table holds");
    for (const InstrumentDefinition& d : table) {
        expect(d.lowSemitone <= d.highSemitone && d.highSemitone <= MAX_CS_SEMITONE, "a range that is not sound");
        expect(d.semitones.size() == size_t(d.highSemitone - d.lowSemitone + 1), "semitones that miss the range");
        for (const NoteSampleSet& set : d.semitones) {
            expect(set.sampleCount <= MAX_CS_NOTESAMPLES, "too many samples for a semitone");
            for (int s = 0; s < set.sampleCount; s++)
                expect(set.samples[s].harmonicCount <= MAX_CS_HARMONICS, "too many harmonics for a sample");
        }
    }
}

static bool sameSample(const NoteSample& a, const NoteSample& b) {
    return std::memcmp(&a.duration, &b.duration, 4) == 0 && a.level == b.level &&
           a.harmonicCount == b.harmonicCount &&
           std::memcmp(a.harmonics, b.harmonics, sizeof(Harmonic) * a.harmonicCount) == 0;
}

static bool sameDefinition(const InstrumentDefinition& a, const InstrumentDefinition& b) {
    if (a.name != b.name || a.kind != b.kind || a.source != b.source || a.midiVoice != b.midiVoice ||
        a.maxNotesInChord != b.maxNotesInChord || std::memcmp(a.scoreThresholds, b.scoreThresholds, 12) != 0 ||
        std::memcmp(&a.middleA, &b.middleA, 4) != 0 || a.lowSemitone != b.lowSemitone ||
        a.highSemitone != b.highSemitone || a.semitones.size() != b.semitones.size())
        return false;
    for (size_t i = 0; i < a.semitones.size(); i++) {
        const NoteSampleSet& x = a.semitones[i];
        const NoteSampleSet& y = b.semitones[i];
        if (x.sampleCount != y.sampleCount) return false;
        for (int s = 0; s < x.sampleCount; s++)
            if (!sameSample(x.samples[s], y.samples[s])) return false;
    }
    return true;
}

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    useOwnFolder();
    std::string input = folder + "CSInst.dat";
    std::string saved = folder + "saved.dat";
    if (!fuzzWriteFile(input, data, size)) return 0;

    clearUiCalls();
    setInstrumentDefinitionsFile(input);
    int loaded = loadInstrumentDefinitions();
    if (!loaded) {
        expect(instrumentDefinitions.definitions.empty(), "a refused file left definitions behind");
        expect(messageCount() == 1, "a refused file without exactly one message");
        expect(instrumentDefinitions.refusedFile == 1 || lastMessageText().rfind("Sorry", 0) == 0,
               "a refused file not kept aside");
        freeInstrumentDefinitions();
        return 0;
    }
    expect(messageCount() == 0, "a message for a file that loaded");
    expectSoundTable();

    std::vector<InstrumentDefinition> first = instrumentDefinitions.definitions;
    setInstrumentDefinitionsFile(saved);
    expect(saveInstrumentDefinitions() == 1, "a loaded table that cannot be saved");
    std::vector<uint8_t> savedBytes = fuzzReadFile(saved);
    expect(savedBytes.size() == size, "a saved file of another size than the one loaded");
    expect(loadInstrumentDefinitions() == 1, "a saved file that does not load");
    expect(instrumentDefinitions.definitions.size() == first.size(), "a round trip that changes the count");
    for (size_t i = 0; i < first.size(); i++)
        expect(sameDefinition(first[i], instrumentDefinitions.definitions[i]),
               "a round trip that changes a definition");
    expect(saveInstrumentDefinitions() == 1, "a reloaded table that cannot be saved");
    expect(fuzzReadFile(saved) == savedBytes, "a second save with other bytes");
    freeInstrumentDefinitions();
    return 0;
}

#ifdef INSTRUMENT_FILE_FUZZ_REPLAY
// The seeds for the shared replay driver: instrumentFileFuzzReplay [runs] | --write-seeds DIR | FILE...
#include "fuzzReplay.h"

using Bytes = std::vector<uint8_t>;

static void putName(Bytes& b, const char* name) {
    size_t n = std::strlen(name);
    for (size_t i = 0; i < 32; i++) {
        b.push_back(i < n ? uint8_t(name[i]) : 0);
        b.push_back(0);
    }
}

// A definition over [low, high] whose semitones hold samples with the given harmonic counts
// (cycled), each harmonic's bytes a pattern of its position.
static void putDefinition(Bytes& b, const char* name, uint8_t low, uint8_t high, const std::vector<int>& samples,
                          const std::vector<int>& harmonics) {
    putName(b, name);
    putName(b, "Real");
    putName(b, "Studio");
    b.push_back(73);
    b.push_back(1);
    fuzzPutFloat(b, 70.0f);
    fuzzPutFloat(b, 30.0f);
    fuzzPutFloat(b, 10.0f);
    fuzzPutFloat(b, 440.0f);
    b.push_back(low);
    b.push_back(high);
    size_t next = 0;
    for (int s = low; s <= high; s++) {
        int count = samples[size_t(s - low) % samples.size()];
        b.push_back(uint8_t(count));
        for (int k = 0; k < count; k++) {
            fuzzPutFloat(b, 0.5f * float(k + 1));
            fuzzPut32(b, 100u * uint32_t(k + 1));
            int h = harmonics[next++ % harmonics.size()];
            b.push_back(uint8_t(h));
            for (int i = 0; i < h * 56; i++) b.push_back(uint8_t(i * 7 + s));
        }
    }
}

static Bytes file(uint32_t count, const std::vector<Bytes>& definitions) {
    Bytes b = {10};
    fuzzPut32(b, count);
    for (const Bytes& d : definitions) b.insert(b.end(), d.begin(), d.end());
    return b;
}

static std::vector<Bytes> seeds() {
    Bytes flute, bass, empty, full;
    putDefinition(flute, "Flute", 60, 63, {1}, {2, 3});
    putDefinition(bass, "Bass Guitar", 28, 29, {2, 0}, {5});
    putDefinition(empty, "Voice", 69, 69, {0}, {0});
    putDefinition(full, "Piano", 126, 127, {2}, {32, 1});
    std::vector<Bytes> all;
    all.push_back(file(0, {}));
    all.push_back(file(1, {flute}));
    all.push_back(file(2, {flute, bass}));
    all.push_back(file(3, {empty, full, flute}));
    all.push_back(file(2, {flute}));          // one definition short
    all.push_back(Bytes{9, 0, 0, 0, 0});      // another version
    all.push_back(Bytes{});
    return all;
}

int main(int argc, char** argv) { return runFuzzReplay(argc, argv, seeds(), LLVMFuzzerTestOneInput, 5000); }
#endif
