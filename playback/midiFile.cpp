// Standard MIDI File writing: chunks, variable-length deltas and events, written through the
// song store's file routines. Track lengths are written as 0 and filled in at the end, when
// every track's size is known.
#include "playback/midiFile.h"

#include <cassert>

#include "platform/files.h"
#include "platform/ui.h"
#include "store/fileRoutines.h"

int encodeVariableLength(uint32_t value, uint8_t* out) {
    if (value > MIDI_MAX_VARIABLE_LENGTH) value = MIDI_MAX_VARIABLE_LENGTH;
    uint8_t groups[4];
    int count = 0;
    do {
        groups[count++] = uint8_t(value & 0x7F);
        value >>= 7;
    } while (value);
    // Most significant group first; every byte but the last has its high bit set.
    for (int i = 0; i < count; i++) out[i] = uint8_t(groups[count - 1 - i] | (i < count - 1 ? 0x80 : 0));
    return count;
}

static void putBytes(MidiFileWriter& w, const void* bytes, uint32_t count) {
    if (!w.ok || count == 0) return;
    if (!writeReportedBytes(w.file, bytes, count)) {
        w.ok = 0;
        return;
    }
    w.position += count;
}

static void putU32(MidiFileWriter& w, uint32_t v) {
    uint8_t b[4] = {uint8_t(v >> 24), uint8_t(v >> 16), uint8_t(v >> 8), uint8_t(v)};
    putBytes(w, b, 4);
}

static void putU16(MidiFileWriter& w, uint16_t v) {
    uint8_t b[2] = {uint8_t(v >> 8), uint8_t(v)};
    putBytes(w, b, 2);
}

static void putDelta(MidiFileWriter& w, uint32_t tick) {
    uint32_t delta = tick > w.lastTick ? tick - w.lastTick : 0;
    if (tick > w.lastTick) w.lastTick = tick;
    uint8_t b[4];
    int count = encodeVariableLength(delta, b);
    putBytes(w, b, uint32_t(count));
}

static uint8_t dataByte(int value) { return uint8_t(value < 0 ? 0 : value > 127 ? 127 : value); }

static uint8_t statusByte(uint8_t kind, int channel) { return uint8_t(kind | (channel & 0x0F)); }

int createMidiFile(MidiFileWriter& w, const std::string& path) {
    w = MidiFileWriter{};
    w.file = createFileBeside(path, &w.path);
    if (!w.file) return 0;
    w.target = path;
    w.ok = 1;
    return 1;
}

void writeMidiHeader(MidiFileWriter& w, uint16_t format, uint16_t trackCount, uint16_t division) {
    assert(trackCount <= MIDI_MAX_TRACKS);
    w.declaredTracks = trackCount;
    putBytes(w, "MThd", 4);
    putU32(w, 6);
    putU16(w, format);
    putU16(w, trackCount);
    putU16(w, division);
}

void beginMidiTrack(MidiFileWriter& w) {
    assert(!w.inTrack && w.trackCount < w.declaredTracks);
    putBytes(w, "MTrk", 4);
    w.lengthAt[w.trackCount] = w.position;
    putU32(w, 0);
    w.trackCount++;
    w.inTrack = 1;
    w.lastTick = 0;
}

void endMidiTrack(MidiFileWriter& w, uint32_t delta) {
    assert(w.inTrack);
    uint64_t tick = uint64_t(w.lastTick) + delta;
    putDelta(w, tick > UINT32_MAX ? UINT32_MAX : uint32_t(tick));
    const uint8_t end[3] = {0xFF, MIDI_META_END_OF_TRACK, 0x00};
    putBytes(w, end, 3);
    int track = w.trackCount - 1;
    w.length[track] = w.position - (w.lengthAt[track] + 4);
    w.inTrack = 0;
}

void writeMidiMetaEvent(MidiFileWriter& w, uint32_t tick, uint8_t type, const uint8_t* data, uint32_t count) {
    putDelta(w, tick);
    const uint8_t head[2] = {0xFF, type};
    putBytes(w, head, 2);
    uint8_t length[4];
    putBytes(w, length, uint32_t(encodeVariableLength(count, length)));
    putBytes(w, data, count);
}

std::string latin1FromUtf8(const std::string& text) {
    std::string out;
    size_t i = 0;
    while (i < text.size()) {
        uint8_t c = uint8_t(text[i]);
        if (c < 0x80) {
            out += char(c);
            i++;
            continue;
        }
        // Length of the sequence this byte leads, 0 for a byte that cannot lead one.
        int length = (c & 0xE0) == 0xC0 ? 2 : (c & 0xF0) == 0xE0 ? 3 : (c & 0xF8) == 0xF0 ? 4 : 0;
        uint32_t codePoint = length == 2 ? (c & 0x1Fu) : length == 3 ? (c & 0x0Fu) : (c & 0x07u);
        bool valid = length > 0 && i + size_t(length) <= text.size();
        for (int k = 1; valid && k < length; k++) {
            uint8_t next = uint8_t(text[i + size_t(k)]);
            if ((next & 0xC0) != 0x80) valid = false;
            codePoint = (codePoint << 6) | (next & 0x3Fu);
        }
        // An overlong two-byte form (C0, C1) would smuggle an ASCII control character in.
        if (valid && length == 2 && codePoint < 0x80) valid = false;
        if (!valid) {
            out += '?';
            i++;
            continue;
        }
        out += codePoint <= 0xFF ? char(uint8_t(codePoint)) : '?';
        i += size_t(length);
    }
    return out;
}

void writeMidiTextEvent(MidiFileWriter& w, uint32_t tick, uint8_t type, const std::string& text) {
    std::string latin1 = latin1FromUtf8(text);
    writeMidiMetaEvent(w, tick, type, reinterpret_cast<const uint8_t*>(latin1.data()), uint32_t(latin1.size()));
}

void writeMidiTempo(MidiFileWriter& w, uint32_t tick, uint32_t microsecondsPerQuarter) {
    const uint8_t tempo[3] = {uint8_t(microsecondsPerQuarter >> 16), uint8_t(microsecondsPerQuarter >> 8),
                              uint8_t(microsecondsPerQuarter)};
    writeMidiMetaEvent(w, tick, MIDI_META_TEMPO, tempo, 3);
}

void writeMidiKeySignature(MidiFileWriter& w, uint32_t tick, int sharps, int minor) {
    const uint8_t key[2] = {uint8_t(int8_t(sharps)), uint8_t(minor ? 1 : 0)};
    writeMidiMetaEvent(w, tick, MIDI_META_KEY_SIGNATURE, key, 2);
}

static void channelEvent(MidiFileWriter& w, uint32_t tick, uint8_t kind, int channel, int data1, int data2) {
    putDelta(w, tick);
    const uint8_t event[3] = {statusByte(kind, channel), dataByte(data1), dataByte(data2)};
    putBytes(w, event, 3);
}

void writeMidiNoteOn(MidiFileWriter& w, uint32_t tick, int channel, int key, int velocity) {
    channelEvent(w, tick, MIDI_NOTE_ON, channel, key, velocity);
}

void writeMidiNoteOff(MidiFileWriter& w, uint32_t tick, int channel, int key) {
    channelEvent(w, tick, MIDI_NOTE_OFF, channel, key, 0);
}

void writeMidiControlChange(MidiFileWriter& w, uint32_t tick, int channel, int controller, int value) {
    channelEvent(w, tick, MIDI_CONTROL_CHANGE, channel, controller, value);
}

void writeMidiProgramChange(MidiFileWriter& w, uint32_t tick, int channel, int program) {
    putDelta(w, tick);
    const uint8_t event[2] = {statusByte(MIDI_PROGRAM_CHANGE, channel), dataByte(program)};
    putBytes(w, event, 2);
}

void writeMidiPitchBend(MidiFileWriter& w, uint32_t tick, int channel, int value) {
    if (value < 0) value = 0;
    if (value > MIDI_PITCH_BEND_MAX) value = MIDI_PITCH_BEND_MAX;
    channelEvent(w, tick, MIDI_PITCH_BEND, channel, value & 0x7F, value >> 7);
}

int finishMidiFile(MidiFileWriter& w) {
    if (!w.file) return 0;
    assert(!w.ok || (!w.inTrack && w.trackCount == w.declaredTracks));
    for (int t = 0; t < w.trackCount && w.ok; t++) {
        if (!seekReportedFile(w.file, w.lengthAt[t])) {
            w.ok = 0;
            break;
        }
        uint8_t b[4] = {uint8_t(w.length[t] >> 24), uint8_t(w.length[t] >> 16), uint8_t(w.length[t] >> 8),
                        uint8_t(w.length[t])};
        if (!writeReportedBytes(w.file, b, 4)) w.ok = 0;
    }
    // A full disk often shows only when the buffered bytes go out, at the close.
    if (w.ok) {
        if (!closeReportedFile(w.file)) w.ok = 0;
    } else {
        fileClose(w.file);
    }
    w.file = nullptr;
    if (w.ok && renameFile(w.path, w.target) != 0) {
        showMessage(MESSAGE_ERROR, "Cannot " + w.target);
        w.ok = 0;
    }
    // Half a MIDI file is no MIDI file: a player or a later reader would take it for one.
    if (!w.ok) fileDelete(w.path);
    return w.ok;
}
