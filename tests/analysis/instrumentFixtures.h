#pragma once
// Fixtures of the instrument suites: a fresh folder for the working files and the definitions
// file, the General MIDI list of this source tree, an empty table and untouched options around
// each test, and little-endian builders for crafted definitions files.

#include <gtest/gtest.h>

#include <cstring>
#include <string>
#include <vector>

#include "analysis/instrumentDefinitions.h"
#include "analysis/recognitionOptions.h"
#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "resources/generalMidi.h"
#include "shell/closeSong.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/song.h"
#include "support/testSupport.h"

using Bytes = std::vector<uint8_t>;

class InstrumentTest : public SharedFolderTest {
protected:
    void SetUp() override {
        SharedFolderTest::SetUp();
        useTestFolders(folder);
        // The General MIDI list and the delivered definitions of this source tree.
        paths.resourcePath = sourceRoot();
        resetGeneralMidiTable();
        resetSettings();
        resetRecognitionOptions();
        setInstrumentDefinitionsFile(definitionsPath());
        freeInstrumentDefinitions();
    }
    void TearDown() override {
        freeInstrumentDefinitions();
        setInstrumentDefinitionsFile("");
        clearFileFailures();
        failAllocation(0);
        closeSong();
        resetRecognitionOptions();
        resetGeneralMidiTable();
        SharedFolderTest::TearDown();
    }
    std::string definitionsPath() const { return folder.file("CSInst.dat"); }
};

inline void putFloat(Bytes& b, float v) {
    uint32_t bits;
    std::memcpy(&bits, &v, 4);
    putU32(b, bits);
}

// A name field: ASCII text as UTF-16, zero-padded to 64 bytes.
inline void putName(Bytes& b, const std::string& name) {
    for (size_t i = 0; i < 32; i++) putU16(b, i < name.size() ? uint16_t(uint8_t(name[i])) : 0);
}

// The fixed part of a definition in the file.
inline void putDefinitionHead(Bytes& b, const std::string& name, uint8_t low, uint8_t high, uint8_t voice = 73,
                              uint8_t chord = 1, float middleA = 440.0f) {
    putName(b, name);
    putName(b, "Real");
    putName(b, "Studio");
    b.push_back(voice);
    b.push_back(chord);
    putFloat(b, 70.0f);
    putFloat(b, 30.0f);
    putFloat(b, 10.0f);
    putFloat(b, middleA);
    b.push_back(low);
    b.push_back(high);
}

// A sample of count harmonics whose 56 bytes each are a pattern of seed.
inline void putSample(Bytes& b, float duration, uint32_t level, int count, uint8_t seed) {
    putFloat(b, duration);
    putU32(b, level);
    b.push_back(uint8_t(count));
    for (int i = 0; i < count * 56; i++) b.push_back(uint8_t(seed + i * 13));
}

inline Bytes fileHead(uint32_t count, uint8_t version = 10) {
    Bytes b = {version};
    putU32(b, count);
    return b;
}

// A definition in memory over [low, high] with no samples.
inline InstrumentDefinition emptyDefinition(const std::string& name, int low, int high) {
    InstrumentDefinition d{};
    d.name = name;
    d.kind = "Real";
    d.source = "Studio";
    d.midiVoice = 73;
    d.maxNotesInChord = 1;
    d.scoreThresholds[0] = 70.0f;
    d.scoreThresholds[1] = 30.0f;
    d.scoreThresholds[2] = 10.0f;
    d.middleA = 440.0f;
    d.lowSemitone = uint8_t(low);
    d.highSemitone = uint8_t(high);
    d.semitones.assign(size_t(high - low + 1), NoteSampleSet{});
    return d;
}

// Fills the table with definitions up to count (each over one semitone).
inline void fillTable(int count) {
    while (int(instrumentDefinitions.definitions.size()) < count)
        instrumentDefinitions.definitions.push_back(
            emptyDefinition("Filler" + std::to_string(instrumentDefinitions.definitions.size()), 60, 60));
}
