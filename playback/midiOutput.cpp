// MIDI output: the note list as a format-1 Standard MIDI File with a tempo track and one
// instrument track per part, plain or following the sung pitch block by block; the Save path's
// entry point; and the chromatic scale file a new instrument is learnt from.
#include "playback/midiOutput.h"

#include <charconv>
#include <cmath>
#include <vector>

#include "analysis/pitchScale.h"
#include "audio/audioActivity.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/allocation.h"
#include "platform/ui.h"
#include "playback/midiFile.h"
#include "resources/generalMidi.h"
#include "resources/strings.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/song.h"

MidiOutputOptions midiOutputOptions;
MidiOutputSong midiOutputSong;

// MIDI keys and data bytes run 0 .. 127 (a note's midiNote may go to 255).
static const int MAX_MIDI_KEY = 127;

void resetMidiOutput() { midiOutputSong = MidiOutputSong{}; }

int velocityFromLevel(float level) {
    float a = level >= 1.0f ? level : 1.0f;   // also catches not-a-number
    double v = 127.0 * std::pow(double(a * 0.003921569f), 0.30103) + 0.5;
    if (!(v < 127.0)) return 127;
    int velocity = int(v);
    return velocity < 1 ? 1 : velocity;
}

// ---- writing the notes ----

// The stretch of the song being written, and where the walk through its notes has got to.
struct MidiRange {
    double start;           // s: seconds; tick 0 lies here
    uint32_t firstBlock;    // block at s
    uint32_t endBlock;      // block at e, the range's end
    uint32_t cursorBlock;   // a block boundary at or before the note being written ...
    double cursorTime;      // ... and its time: block lookups walk on from here, not from block 0
};

// The block boundary nearest to t. Notes are in time order, so the walk begins at the cursor
// rather than at block 0 (a long song would otherwise be walked from its start twice a note);
// a time before the cursor is walked from the start.
static uint32_t blockOf(const MidiRange& range, double t) {
    if (!(t >= range.cursorTime)) return blockAtTime(t);
    return blockAtTime(t, range.cursorBlock, range.cursorTime);
}

// Moves the cursor on (never back) to the boundary before the one nearest to t, which lies
// before t: the nearest may lie after it.
static void advanceCursor(MidiRange& range, double t) {
    uint32_t block = blockOf(range, t);
    if (block > 0) block--;
    if (block <= range.cursorBlock) return;
    range.cursorTime += songTimeOfBlock(block, range.cursorBlock);
    range.cursorBlock = block;
}

// Ticks of a time offset from the range start: truncated, never below 0 nor above what a
// delta can carry.
static uint32_t ticksOf(double offset) {
    double ticks = offset * MIDI_TICKS_PER_SECOND;
    if (!(ticks > 0.0)) return 0;
    if (ticks >= double(MIDI_MAX_VARIABLE_LENGTH)) return MIDI_MAX_VARIABLE_LENGTH;
    return uint32_t(ticks);
}

static uint32_t tickAt(const MidiRange& range, double t) { return ticksOf(t - range.start); }

static int noteTaken(const Note& note, const MidiRange& range) {
    return blockOf(range, note.midiStart) < range.endBlock && range.firstBlock < blockOf(range, note.midiEnd);
}

static double onTime(const Note& note, const MidiRange& range) {
    return note.midiStart > range.start ? double(note.midiStart) : range.start;
}

// The note's average block level over the part being written, as a velocity.
static int noteVelocity(const Note& note, const MidiRange& range, double tOn) {
    int64_t blocks = int64_t(blockOf(range, note.midiEnd)) - int64_t(blockOf(range, tOn));
    // A note narrower than a block boundary step would divide by zero; it counts as one block.
    if (blocks < 1) blocks = 1;
    return velocityFromLevel(float(note.volumeSum) / float(blocks));
}

// The bend of frequency against a key's frequency in pitch bend units, before limiting. A
// frequency that is not positive (a damaged block) bends nothing.
static int rawBend(double frequency, double keyFrequency) {
    if (!(frequency > 0.0) || !(keyFrequency > 0.0) || !std::isfinite(frequency)) return 0;
    double units = 1200.0 * std::log2(frequency / keyFrequency) * MIDI_PITCH_BEND_UNITS_PER_CENT;
    if (units > 1.0e9) return 1000000000;
    if (units < -1.0e9) return -1000000000;
    return int(units);
}

static int bendInRange(int bend) { return bend >= MIDI_PITCH_BEND_LOW && bend <= MIDI_PITCH_BEND_HIGH; }

static int bendValue(int bend) {
    if (bend < MIDI_PITCH_BEND_LOW) bend = MIDI_PITCH_BEND_LOW;
    if (bend > MIDI_PITCH_BEND_HIGH) bend = MIDI_PITCH_BEND_HIGH;
    return bend + MIDI_PITCH_BEND_CENTRE;
}

static int limitKey(int key) { return key < 0 ? 0 : key > MAX_MIDI_KEY ? MAX_MIDI_KEY : key; }

// Plain mode: one MIDI note per note, bent to the note's pitch when that is off its key.
static void writePlainNotes(MidiFileWriter& w, int channel, MidiRange& range) {
    int currentBend = MIDI_PITCH_BEND_CENTRE;
    for (int i = 0; i < noteList.count; i++) {
        const Note& note = noteList.notes[i];
        advanceCursor(range, note.midiStart);
        if (!noteTaken(note, range)) continue;
        double tOn = onTime(note, range);
        int key = limitKey(note.midiNote);
        writeMidiNoteOn(w, tickAt(range, tOn), channel, key, noteVelocity(note, range, tOn));
        int value = bendValue(rawBend(note.pitch, pitchToFrequency(key)));
        if (value != currentBend) {
            writeMidiPitchBend(w, tickAt(range, tOn), channel, value);
            currentBend = value;
        }
        writeMidiNoteOff(w, tickAt(range, note.midiEnd), channel, key);
    }
}

// What detail mode needs of one block: its detected pitch and level.
struct BlockPitch {
    bool pitched;        // the block has a detected frequency
    double frequency;    // entry 0's frequency, Hz
    int amplitude;       // entry 0's amplitude, 0 .. 255
};

// Detail mode's reading of the FTBlockWindow, which it moves along the song as it goes.
struct DetailReader {
    bool windowFailed;   // a load failed (and was reported): blocks not held stay unpitched
};

static BlockPitch blockPitch(DetailReader& reader, uint32_t block) {
    BlockPitch none{false, 0.0, 0};
    if (block >= song.blockCount) return none;
    const FTBlockWindow& window = ftBlockWindow;
    bool held = block >= window.firstBlock && block < window.endBlock;
    if (!held && !reader.windowFailed) {
        loadFTBlockWindow(block, block + 1);
        held = block >= window.firstBlock && block < window.endBlock;
        // One failure is reported once; trying again for every block would repeat it.
        if (!held) reader.windowFailed = true;
    }
    size_t slot = block - window.firstBlock;
    if (!held || slot >= window.detectedFrequenciesBuffers.size()) return none;
    const FTDetectedBuffer& detected = window.detectedFrequenciesBuffers[slot];
    if (detected.nEntries == 0 || detected.nEntries >= FT_DETECTED_ENTRIES) return none;
    double frequency = detected.entries[0].frequency;
    // A frequency that is not positive has no pitch, whatever the count says.
    if (!(frequency > 0.0) || !std::isfinite(frequency)) return none;
    return BlockPitch{true, frequency, detected.entries[0].amplitude};
}

// Note j joins the stretch ending with note j - 1: taken, starting within half a block of its
// predecessor's end, and both sides of the gap pitched within MIDI_JOIN_SEMITONES.
static int joinsPrevious(DetailReader& reader, int j, const MidiRange& range) {
    const Note& before = noteList.notes[j - 1];
    const Note& note = noteList.notes[j];
    if (!noteTaken(note, range)) return 0;
    if (double(note.midiStart) > double(before.midiEnd) + song.sampleBlockDuration / 2) return 0;
    uint32_t beforeEnd = blockOf(range, before.midiEnd);
    if (beforeEnd == 0) return 0;
    BlockPitch last = blockPitch(reader, beforeEnd - 1);
    BlockPitch first = blockPitch(reader, blockOf(range, note.midiStart));
    if (!last.pitched || !first.pitched) return 0;
    return std::fabs(frequencyToPitch(last.frequency) - frequencyToPitch(first.frequency)) <= MIDI_JOIN_SEMITONES;
}

// The last block (index into blocks) from `from` on up to which every pitched block stays
// within the bend range of key: one before the first that does not, or the stretch's last.
static int keyReach(const std::vector<BlockPitch>& blocks, int from, int key) {
    double keyFrequency = pitchToFrequency(key);
    for (int c = from; c < int(blocks.size()); c++)
        if (blocks[c].pitched && !bendInRange(rawBend(blocks[c].frequency, keyFrequency))) return c - 1;
    return int(blocks.size()) - 1;
}

// The key for the pitched block `from`: its nearest key, unless a key up to MIDI_KEY_SEARCH
// away holds the pitch further through the stretch (rising order, the first longer reach wins).
static int chooseKey(const std::vector<BlockPitch>& blocks, int from) {
    int nearest = limitKey(frequencyToSemitone(blocks[from].frequency));
    int last = int(blocks.size()) - 1;
    int best = nearest;
    int bestReach = keyReach(blocks, from, nearest);
    if (bestReach >= last) return best;
    int lowest = nearest - MIDI_KEY_SEARCH < 0 ? 0 : nearest - MIDI_KEY_SEARCH;
    int highest = nearest + MIDI_KEY_SEARCH > MAX_MIDI_KEY ? MAX_MIDI_KEY : nearest + MIDI_KEY_SEARCH;
    for (int key = lowest; key <= highest; key++) {
        if (key == nearest) continue;
        int reach = keyReach(blocks, from, key);
        if (reach > bestReach) {
            best = key;
            bestReach = reach;
            if (reach >= last) break;
        }
    }
    return best;
}

// Writes notes first .. last as one stretch following the blocks' pitch and level. 1; 0 when
// the memory for the stretch's blocks could not be had (reported).
static int writeDetailStretch(MidiFileWriter& w, int channel, const MidiRange& range, DetailReader& reader,
                              int first, int last) {
    const Note& opening = noteList.notes[first];
    const Note& closing = noteList.notes[last];
    double tOn = onTime(opening, range);
    uint32_t fromBlock = blockOf(range, tOn);
    uint32_t toBlock = blockOf(range, closing.midiEnd);
    if (toBlock > song.blockCount) toBlock = song.blockCount;
    int velocity = noteVelocity(opening, range, tOn);

    std::vector<BlockPitch> blocks;
    if (toBlock > fromBlock) {
        if (!tryResize(blocks, toBlock - fromBlock)) {
            showMessage(MESSAGE_ERROR, resourceString(10401));
            return 0;
        }
    }
    // Blocks in ascending order, so the window moves forward only.
    for (uint32_t b = fromBlock; b < toBlock; b++) blocks[b - fromBlock] = blockPitch(reader, b);

    int step = 1;
    if (song.sampleBlockDuration > 0.0) step = int(MIDI_DETAIL_UPDATE_SECONDS / song.sampleBlockDuration);
    if (step < 1) step = 1;

    int key = -1;             // the key sounding; -1 none
    double keyFrequency = 0.0;
    int lastBend = -1;        // the last bend value written in this stretch; -1 none
    int volume = 0;           // the stretch's current volume
    double offset = 0.0;      // start of block b less the start of fromBlock, seconds
    uint32_t offsetBlock = fromBlock;
    for (int i = 0; i < int(blocks.size()); i += step) {
        const BlockPitch& block = blocks[i];
        if (!block.pitched) continue;
        uint32_t b = fromBlock + uint32_t(i);
        offset += songTimeOfBlock(b, offsetBlock);
        offsetBlock = b;
        uint32_t tick = ticksOf(tOn - range.start + offset);
        if (key >= 0 && !bendInRange(rawBend(block.frequency, keyFrequency))) {
            writeMidiNoteOff(w, tick, channel, key);
            key = -1;
        }
        if (key < 0) {
            key = chooseKey(blocks, i);
            keyFrequency = pitchToFrequency(key);
            writeMidiNoteOn(w, tick, channel, key, velocity);
            volume = velocity;
        }
        int value = bendValue(rawBend(block.frequency, keyFrequency));
        if (value != lastBend) {
            writeMidiPitchBend(w, tick, channel, value);
            lastBend = value;
        }
        int level = velocityFromLevel(float(block.amplitude));
        if (level != volume) {
            writeMidiControlChange(w, tick, channel, MIDI_CC_CHANNEL_VOLUME, level);
            volume = level;
        }
    }
    if (key >= 0) writeMidiNoteOff(w, tickAt(range, closing.midiEnd), channel, key);
    return 1;
}

// Detail mode: runs of legato notes joined into stretches. 1; 0 after a reported failure.
static int writeDetailNotes(MidiFileWriter& w, int channel, MidiRange& range, DetailReader& reader) {
    int i = 0;
    while (i < noteList.count) {
        advanceCursor(range, noteList.notes[i].midiStart);
        if (!noteTaken(noteList.notes[i], range)) {
            i++;
            continue;
        }
        int k = i;
        while (k + 1 < noteList.count && joinsPrevious(reader, k + 1, range)) k++;
        if (!writeDetailStretch(w, channel, range, reader, i, k)) return 0;
        i = k + 1;
    }
    return 1;
}

// The wait cursor and the status text while a file is generated, taken back on every return.
struct GeneratingMidi {
    GeneratingMidi() {
        setWaitCursor(true);
        setStatusText(GENERATING_MIDI_TEXT);
    }
    ~GeneratingMidi() {
        setWaitCursor(false);
        setStatusText("");
    }
};

static int writeMidiFile(const std::string& path, int detail, double start, double end, int reportCreate) {
    if (recordingOrOpeningActive()) return 0;
    MidiRange range;
    range.start = start < 0.0 ? 0.0 : start;
    range.firstBlock = blockAtTime(range.start);
    range.endBlock = blockAtTime(end < 0.0 ? songDuration() : end);
    range.cursorBlock = 0;
    range.cursorTime = 0.0;

    MidiFileWriter w;
    if (!createMidiFile(w, path)) {
        if (reportCreate) showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    GeneratingMidi generating;

    int parts = midiOutputOptions.singleTrack || midiOutputSong.partCount < 1 ? 1 : midiOutputSong.partCount;
    int tracks = 1 + parts < MIDI_MAX_TRACKS ? 1 + parts : MIDI_MAX_TRACKS;
    writeMidiHeader(w, 1, uint16_t(tracks), MIDI_DIVISION);

    beginMidiTrack(w);
    writeMidiTextEvent(w, 0, MIDI_META_NOTICE, resourceString(MIDI_CREDIT_STRING));
    writeMidiTempo(w, 0, MIDI_TEMPO);
    endMidiTrack(w, 0);

    std::string instrument = songInstrumentName();
    DetailReader reader{false};
    for (int t = 1; t < tracks; t++) {
        // The tenth channel (index 9) is General MIDI's percussion: never used for notes.
        int channel = t <= 9 ? t - 1 : t;
        // The list's transposition for the name is not applied: the notes sound as sung.
        int program = generalMidiProgram(instrument, nullptr, t);
        range.cursorBlock = 0;
        range.cursorTime = 0.0;
        beginMidiTrack(w);
        writeMidiTextEvent(w, 0, MIDI_META_TRACK_NAME, instrument);
        if (midiOutputOptions.reverb) writeMidiControlChange(w, 0, channel, MIDI_CC_REVERB, midiOutputOptions.reverbDepth);
        writeMidiControlChange(w, 0, channel, MIDI_CC_PAN, MIDI_PAN);
        writeMidiControlChange(w, 0, channel, MIDI_CC_BANK_SELECT, 0);
        writeMidiControlChange(w, 0, channel, MIDI_CC_BANK_SELECT_FINE, 0);
        writeMidiProgramChange(w, 0, channel, program - 1);
        writeMidiKeySignature(w, 0, 0, 0);
        if (detail) {
            if (!writeDetailNotes(w, channel, range, reader)) w.ok = 0;
        } else {
            writePlainNotes(w, channel, range);
        }
        if (!w.ok) break;
        endMidiTrack(w, 1);
    }
    return finishMidiFile(w);
}

int writeNotesMidiFile(const std::string& path, int detail, int forPlayback, double start, double end) {
    (void)forPlayback;
    return writeMidiFile(path, detail, start, end, 0);
}

int saveMidiFile(const std::string& path, int detail, int onlySelectedRange) {
    if (recordingOrOpeningActive()) return 0;
    double start = -1.0;
    double end = -1.0;
    double a = selection.timeSelectionStart;
    double b = selection.timeSelectionEnd;
    if (onlySelectedRange && a >= 0.0 && b >= 0.0 && b - a > song.sampleBlockDuration / 2) {
        start = a;
        end = b;
    }
    // Unlike playback, a save that cannot create its file says so: the user is waiting for it.
    return writeMidiFile(path, detail, start, end, 1);
}

// ---- the instrument scale ----

std::string scaleMidiFileName(const std::string& name, int lowSemitone, int highSemitone, double noteDuration,
                              int level) {
    // Fixed to one decimal with a "." whatever the locale says.
    char duration[64];
    std::to_chars_result written =
        std::to_chars(duration, duration + sizeof duration, noteDuration, std::chars_format::fixed, 1);
    std::string durationText = written.ec == std::errc() ? std::string(duration, written.ptr) : "0.0";
    return name + "_" + std::to_string(lowSemitone) + "_" + std::to_string(highSemitone) + "_" + durationText + "_" +
           std::to_string(level) + ".mid";
}

static uint32_t scaleTicks(double seconds) { return uint32_t(seconds * SCALE_MIDI_TICKS_PER_SECOND); }

int writeScaleMidiFile(const std::string& path, const std::string& name, int lowSemitone, int highSemitone,
                       double noteDuration, int level) {
    if (lowSemitone < 0 || highSemitone > MAX_MIDI_KEY || lowSemitone > highSemitone) return 0;
    if (!(noteDuration > 0.0) || noteDuration > MAX_NOTE_DURATION) return 0;
    MidiFileWriter w;
    if (!createMidiFile(w, path)) {
        showMessage(MESSAGE_ERROR, "Cannot " + path);
        return 0;
    }
    writeMidiHeader(w, 1, 2, SCALE_MIDI_DIVISION);
    beginMidiTrack(w);
    writeMidiTextEvent(w, 0, MIDI_META_TRACK_NAME, resourceString(MIDI_CREDIT_STRING));
    writeMidiTempo(w, 0, MIDI_TEMPO);
    endMidiTrack(w, 0);

    beginMidiTrack(w);
    writeMidiTextEvent(w, 0, MIDI_META_TRACK_NAME, name);
    writeMidiProgramChange(w, 0, 0, generalMidiProgram(name) - 1);
    int velocity = velocityFromLevel(float(level));
    for (int key = lowSemitone; key <= highSemitone; key++) {
        double on = 2.0 * (key - lowSemitone) * noteDuration;
        writeMidiNoteOn(w, scaleTicks(on), 0, key, velocity);
        writeMidiNoteOff(w, scaleTicks(on + noteDuration), 0, key);
    }
    endMidiTrack(w, 0);
    return finishMidiFile(w);
}
