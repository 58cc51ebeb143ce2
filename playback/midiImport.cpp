// MIDI file import. The whole file is read into memory and taken apart chunk by chunk, every
// length checked against what the file and its track hold. The file is walked twice: first for
// its tempo changes (in a format-1 file they sit in the first track but rule every track), then
// for its notes.
#include "playback/midiImport.h"

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>
#include <vector>

#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/allocation.h"
#include "platform/files.h"
#include "platform/ui.h"
#include "playback/midiOutput.h"
#include "resources/generalMidi.h"
#include "resources/strings.h"
#include "shell/settings.h"
#include "store/song.h"
#include "store/songWindowHooks.h"

MidiImport midiImport;

// Microseconds per quarter note of MIDI_IMPORT_QUARTERS_PER_MINUTE.
static const double DEFAULT_QUARTER_MICROSECONDS = 60.0e6 / MIDI_IMPORT_QUARTERS_PER_MINUTE;
// The SMPTE rate -29 stands for 29.97 frames per second (drop frame).
static const double DROP_FRAME_RATE = 29.97;
static const int HEADER_BYTES = 14;   // "MThd", its length, format, track count, division
static const uint8_t META_END_OF_TRACK = 0x2F;
static const uint8_t META_TEMPO = 0x51;

void resetMidiImport() { midiImport = MidiImport{}; }

bool isMidiFileName(const std::string& path) {
    std::string lower;
    for (char c : path) lower += char(std::tolower(static_cast<unsigned char>(c)));
    auto endsWith = [&lower](const char* ending) {
        size_t n = std::strlen(ending);
        return lower.size() >= n && lower.compare(lower.size() - n, n, ending) == 0;
    };
    return endsWith(".mid") || endsWith(".midi");
}

// ---- time ----

struct TempoChange {
    uint64_t tick;
    double microsecondsPerQuarter;
    double seconds;   // the time at tick
};

// How the file's ticks become seconds and beats.
struct MidiTimeBase {
    bool smpte;                         // the division counts frames, not quarter notes
    double ticksPerQuarter;             // metrical division
    double ticksPerSecond;              // SMPTE: frames per second x ticks per frame
    std::vector<TempoChange> tempos;    // ascending ticks; the last change at a tick rules
};

// Fills in each change's time; changes must be in ascending ticks.
static void timeTempos(MidiTimeBase& base) {
    double seconds = 0.0;
    uint64_t tick = 0;
    double rate = DEFAULT_QUARTER_MICROSECONDS;
    for (TempoChange& change : base.tempos) {
        seconds += double(change.tick - tick) * rate / 1.0e6 / base.ticksPerQuarter;
        change.seconds = seconds;
        tick = change.tick;
        rate = change.microsecondsPerQuarter;
    }
}

static double secondsAt(const MidiTimeBase& base, uint64_t tick) {
    if (base.smpte) return double(tick) / base.ticksPerSecond;
    auto after = std::upper_bound(base.tempos.begin(), base.tempos.end(), tick,
                                  [](uint64_t t, const TempoChange& change) { return t < change.tick; });
    if (after == base.tempos.begin()) return double(tick) * DEFAULT_QUARTER_MICROSECONDS / 1.0e6 / base.ticksPerQuarter;
    const TempoChange& change = *(after - 1);
    return change.seconds + double(tick - change.tick) * change.microsecondsPerQuarter / 1.0e6 / base.ticksPerQuarter;
}

// Beats for the score: the file's quarter notes, or for a time base of frames its seconds at
// the score's 100 quarter notes per minute.
static double beatsAt(const MidiTimeBase& base, uint64_t tick) {
    if (base.smpte) return secondsAt(base, tick) * MIDI_IMPORT_QUARTERS_PER_MINUTE / 60.0;
    return double(tick) / base.ticksPerQuarter;
}

// A length in the score's units: truncated, 0 when negative.
static uint32_t scoreUnits(double beats) {
    double units = beats * MIDI_SCORE_UNITS_PER_BEAT;
    if (!(units > 0.0)) return 0;
    return units >= 4294967295.0 ? UINT32_MAX : uint32_t(units);
}

// ---- reading the bytes ----

static uint32_t bigEndian32(const uint8_t* b) {
    return uint32_t(b[0]) << 24 | uint32_t(b[1]) << 16 | uint32_t(b[2]) << 8 | b[3];
}

// One track chunk being read.
struct TrackReader {
    const uint8_t* bytes;     // the whole file
    size_t at;                // next byte
    size_t end;               // the chunk's end, never past the file's
    bool cutShort;            // the chunk's declared end lies past the end of the file
    uint64_t tick;            // the track time
    uint8_t runningStatus;    // the last channel status, which a data byte repeats; 0 none
    int track;                // the track chunk's number from 1, for messages
};

struct MidiEvent {
    size_t at;                // file offset where the event (its delta time) began
    uint8_t status;           // channel status with its channel, 0xFF meta, other system statuses
    uint8_t data[2];          // channel events' data bytes
    uint8_t metaType;         // meta events
    size_t dataAt;            // meta events: where their data lies in the file ...
    uint32_t dataLength;      // ... and how long it is
};

enum TrackStep {
    STEP_EVENT = 0,       // *event was read
    STEP_TRACK_END = 1,   // the chunk is read (its end, or its end-of-track event)
    STEP_FILE_END = 2,    // the file ends inside the chunk: the reading ends here
    STEP_BAD = 3          // the bytes cannot be an event: *reason says why
};

static std::string byteText(size_t at) { return "at byte " + std::to_string(at); }

// The bytes ran out in the middle of an event: the end of a file ends the reading; a track
// chunk that ends there is damaged.
static int outOfBytes(const TrackReader& r, size_t eventAt, std::string* reason) {
    if (r.cutShort) return STEP_FILE_END;
    *reason = "track " + std::to_string(r.track) + " ends inside the event " + byteText(eventAt);
    return STEP_BAD;
}

// A variable-length number: 1 read; 0 the track's bytes ran out; -1 longer than four bytes,
// which no Standard MIDI File holds.
static int readVariableLength(TrackReader& r, uint32_t* value) {
    uint32_t v = 0;
    for (int i = 0; i < 4; i++) {
        if (r.at >= r.end) return 0;
        uint8_t b = r.bytes[r.at++];
        v = (v << 7) | (b & 0x7F);
        if (!(b & 0x80)) {
            *value = v;
            return 1;
        }
    }
    return -1;
}

// A length field and the bytes it counts, which must lie within the track.
static int skipCounted(TrackReader& r, MidiEvent* e, std::string* reason) {
    uint32_t length = 0;
    int read = readVariableLength(r, &length);
    if (read == 0) return outOfBytes(r, e->at, reason);
    if (read < 0) {
        *reason = "a length longer than four bytes in the event " + byteText(e->at);
        return STEP_BAD;
    }
    if (length > r.end - r.at) {
        if (r.cutShort) return STEP_FILE_END;
        *reason = "the event " + byteText(e->at) + " is longer than its track";
        return STEP_BAD;
    }
    e->dataAt = r.at;
    e->dataLength = length;
    r.at += length;
    return STEP_EVENT;
}

static int readEvent(TrackReader& r, MidiEvent* e, std::string* reason) {
    if (r.at >= r.end) return r.cutShort ? STEP_FILE_END : STEP_TRACK_END;
    *e = MidiEvent{};
    e->at = r.at;
    uint32_t delta = 0;
    int read = readVariableLength(r, &delta);
    if (read == 0) return outOfBytes(r, e->at, reason);
    if (read < 0) {
        *reason = "a delta time longer than four bytes " + byteText(e->at);
        return STEP_BAD;
    }
    r.tick += delta;
    if (r.at >= r.end) return outOfBytes(r, e->at, reason);

    uint8_t status = r.bytes[r.at];
    if (status < 0x80) {
        // Running status: the data bytes of another event of the last channel status.
        if (!r.runningStatus) {
            *reason = "a data byte where an event should begin " + byteText(r.at);
            return STEP_BAD;
        }
        status = r.runningStatus;
    } else {
        r.at++;
    }
    e->status = status;
    if (status < 0xF0) {
        r.runningStatus = status;
        size_t count = (status & 0xF0) == 0xC0 || (status & 0xF0) == 0xD0 ? 1 : 2;
        if (r.end - r.at < count) return outOfBytes(r, e->at, reason);
        e->data[0] = r.bytes[r.at];
        if (count == 2) e->data[1] = r.bytes[r.at + 1];
        r.at += count;
        return STEP_EVENT;
    }
    // Meta and system exclusive events end any running status.
    r.runningStatus = 0;
    if (status == 0xFF) {
        if (r.at >= r.end) return outOfBytes(r, e->at, reason);
        e->metaType = r.bytes[r.at++];
        int step = skipCounted(r, e, reason);
        if (step == STEP_EVENT && e->metaType == META_END_OF_TRACK) r.at = r.end;
        return step;
    }
    // A system exclusive message, or its continuation, carries its length.
    if (status == 0xF0 || status == 0xF7) return skipCounted(r, e, reason);
    // No other status belongs in a file: it is passed over up to and including the next 0xF7.
    const void* f7 = std::memchr(r.bytes + r.at, 0xF7, r.end - r.at);
    r.at = f7 ? size_t(static_cast<const uint8_t*>(f7) - r.bytes) + 1 : r.end;
    return STEP_EVENT;
}

// The chunks of the file after its header, one at a time.
struct ChunkWalk {
    const std::vector<uint8_t>& bytes;
    size_t at = HEADER_BYTES;
    int tracks = 0;   // track chunks found so far
};

// The next track chunk into *r; false when there is none (chunks that are not "MTrk" are
// skipped by their length, and one that cannot be skipped ends the walk).
static bool nextTrack(ChunkWalk& walk, TrackReader* r) {
    const std::vector<uint8_t>& b = walk.bytes;
    while (b.size() - walk.at >= 8) {
        const uint8_t* head = b.data() + walk.at;
        uint64_t length = bigEndian32(head + 4);
        walk.at += 8;
        uint64_t left = b.size() - walk.at;
        if (std::memcmp(head, "MTrk", 4) != 0) {
            if (length > left) return false;
            walk.at += size_t(length);
            continue;
        }
        *r = TrackReader{};
        r->bytes = b.data();
        r->at = walk.at;
        r->cutShort = length > left;
        r->end = r->cutShort ? b.size() : walk.at + size_t(length);
        r->track = ++walk.tracks;
        walk.at = r->end;
        return true;
    }
    return false;
}

// The tempo changes of every track (the first pass). A damaged track gives those before the
// damage; the second pass reports it.
static std::vector<std::vector<TempoChange>> readTempos(const std::vector<uint8_t>& bytes) {
    std::vector<std::vector<TempoChange>> tempos;
    ChunkWalk walk{bytes};
    TrackReader r;
    while (nextTrack(walk, &r)) {
        tempos.emplace_back();
        MidiEvent e;
        std::string reason;
        while (readEvent(r, &e, &reason) == STEP_EVENT) {
            if (e.status != 0xFF || e.metaType != META_TEMPO || e.dataLength != 3) continue;
            const uint8_t* d = bytes.data() + e.dataAt;
            uint32_t microseconds = uint32_t(d[0]) << 16 | uint32_t(d[1]) << 8 | d[2];
            // A tempo of 0 would stop time: it is passed over.
            if (microseconds > 0) tempos.back().push_back({r.tick, double(microseconds), 0.0});
        }
    }
    return tempos;
}

// ---- the notes ----

struct PendingNote {
    uint64_t tick;      // where it started
    uint8_t velocity;   // 0: no note sounding
};

// The reading of the notes (the second pass).
struct NoteReading {
    MidiTimeBase base;
    std::vector<std::vector<TempoChange>> trackTempos;   // each track's own changes (a format-2 file's)
    bool tempoPerTrack;              // format 2: each track is a piece of its own with its own tempo
    PendingNote pending[16][128];
    int channelProgram[16];          // each channel's last program change, whatever the parts
    int firstChannel;                // the channel of the first note kept; -1 before it
    double lastEndBeats;             // where the last note kept ended, beats
    std::string reason;              // why the file was refused part-way
};

// Releases the note of channel and key sounding since its start, at tick. 0 when the note
// would end later than a song can last (reason set); else 1.
static int releaseNote(NoteReading& reading, int channel, int key, uint64_t tick, size_t at) {
    PendingNote& p = reading.pending[channel][key];
    if (p.velocity == 0) return 1;
    if (noteList.count < MAX_CS_NOTES) {
        double start = secondsAt(reading.base, p.tick);
        double end = secondsAt(reading.base, tick);
        if (!(end <= MAX_IMPORTED_SONG_SECONDS)) {
            reading.reason = "the note ending " + byteText(at) + " lies later than the longest song (" +
                             std::to_string(int(MAX_IMPORTED_SONG_SECONDS / 3600)) + " hours)";
            return 0;
        }
        double startBeats = beatsAt(reading.base, p.tick);
        double endBeats = beatsAt(reading.base, tick);
        Note note{};
        note.pitch = float(pitchToFrequency(key));
        note.midiStart = float(start);
        note.midiEnd = float(end);
        // The note's stretch of the song is its own time: without it the note would have no
        // length to edit, list or draw in the Wave views.
        note.waveStart = note.midiStart;
        note.waveEnd = note.midiEnd;
        for (float& value : note.recognitionValues) value = float(p.velocity);
        note.recognitionWeight = MIDI_IMPORTED_WEIGHT;
        note.midiNote = uint8_t(key);
        note.instrument = -1;
        note.sourceIndex = uint32_t(channel);
        note.recognitionExtra[0] = scoreUnits(endBeats - startBeats);
        note.recognitionExtra[1] = noteList.count == 0 ? 0 : scoreUnits(startBeats - reading.lastEndBeats);
        appendNote(note);
        reading.lastEndBeats = endBeats;
        if (reading.firstChannel < 0) reading.firstChannel = channel;
    }
    p.velocity = 0;
    return 1;
}

// Reads the notes of every track; STEP_TRACK_END when the file was read, STEP_BAD when it was
// refused part-way (reading.reason).
static int readNotes(const std::vector<uint8_t>& bytes, NoteReading& reading) {
    ChunkWalk walk{bytes};
    TrackReader r;
    while (nextTrack(walk, &r)) {
        if (reading.tempoPerTrack) {
            size_t t = size_t(r.track - 1);
            reading.base.tempos = t < reading.trackTempos.size() ? reading.trackTempos[t] : std::vector<TempoChange>{};
            timeTempos(reading.base);
        }
        for (auto& channel : reading.pending)
            for (PendingNote& p : channel) p.velocity = 0;
        MidiEvent e;
        int step;
        while ((step = readEvent(r, &e, &reading.reason)) == STEP_EVENT) {
            if (e.status >= 0xF0) continue;
            int channel = e.status & 0x0F;
            int kind = e.status & 0xF0;
            if (kind == 0x80 || kind == 0x90) {
                int key = e.data[0];
                if (key >= 128) {
                    reading.reason = "a note key of " + std::to_string(key) + " in the event " + byteText(e.at);
                    return STEP_BAD;
                }
                if (kind == 0x90 && e.data[1] != 0) {
                    // A key struck again before its release loses the first start.
                    reading.pending[channel][key] = PendingNote{r.tick, e.data[1]};
                } else if (!releaseNote(reading, channel, key, r.tick, e.at)) {
                    return STEP_BAD;
                }
            } else if (kind == 0xC0) {
                reading.channelProgram[channel] = e.data[0];
                if (channel < midiImport.partCount) midiImport.parts[channel].program = e.data[0];
            }
        }
        if (step == STEP_BAD) return STEP_BAD;
        if (step == STEP_FILE_END) break;
    }
    return STEP_TRACK_END;
}

// Parts no note belongs to are removed; the notes of later parts move down one part number.
static void removeEmptyParts() {
    MidiImport& m = midiImport;
    int p = 0;
    while (p < m.partCount) {
        bool used = false;
        for (int i = 0; i < noteList.count && !used; i++) used = noteList.notes[i].sourceIndex == uint32_t(p);
        if (used) {
            p++;
            continue;
        }
        for (int k = p; k + 1 < m.partCount; k++) m.parts[k] = m.parts[k + 1];
        m.partCount--;
        m.parts[m.partCount] = MidiPart{};
        for (int i = 0; i < noteList.count; i++)
            if (noteList.notes[i].sourceIndex > uint32_t(p)) noteList.notes[i].sourceIndex--;
    }
}

// A time axis of nominal blocks, as a new song's analysis would have them, up to the end of
// the last note. 1; 0 after the memory message.
static int makeNotesTimeAxis() {
    applyAnalysisPreferences();
    double duration = recognitionOptions.blockDuration;
    double end = 0.0;
    for (int i = 0; i < noteList.count; i++) end = std::max(end, double(noteList.notes[i].midiEnd));
    uint32_t blocks = uint32_t(std::ceil(end / duration));
    song.sampleBlockDuration = duration;
    if (!growSampleBlockDurations(blocks)) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    std::fill(song.sampleBlockDurations.begin(), song.sampleBlockDurations.begin() + blocks, duration);
    song.blockCount = blocks;
    song.notesOnly = blocks > 0;
    return 1;
}

// Block lookups for times that never go back: each walks on from a block boundary before the
// last time asked, so that a run of lookups walks the song once.
struct BlockCursor {
    uint32_t block = 0;   // a block boundary ...
    double time = 0.0;    // ... and its time

    // The block boundary nearest to t, which must not lie before the last time asked.
    uint32_t nearest(double t) {
        uint32_t k = blockAtTime(t, block, time);
        // The boundary before the nearest lies before t: the nearest may lie after it.
        if (k > block + 1) {
            time += songTimeOfBlock(k - 1, block);
            block = k - 1;
        }
        return k;
    }
};

// Each note's volumeSum, as the song's blocks count it, gives back the note's velocity when the
// note is written as MIDI again: the smallest sum whose level per block reaches it.
static void setNoteVolumes() {
    // Notes are in start order; their ends are looked up in end order, so that long notes
    // that overlap do not each walk the song from their start to their end.
    std::vector<int> byEnd(size_t(noteList.count));
    for (int i = 0; i < noteList.count; i++) byEnd[size_t(i)] = i;
    std::stable_sort(byEnd.begin(), byEnd.end(),
                     [](int a, int b) { return noteList.notes[a].midiEnd < noteList.notes[b].midiEnd; });
    std::vector<uint32_t> lastBlock(size_t(noteList.count));
    BlockCursor ends;
    for (int i : byEnd) lastBlock[size_t(i)] = ends.nearest(noteList.notes[i].midiEnd);

    BlockCursor starts;
    for (int i = 0; i < noteList.count; i++) {
        Note& note = noteList.notes[i];
        int64_t blocks = int64_t(lastBlock[size_t(i)]) - int64_t(starts.nearest(note.midiStart));
        if (blocks < 1) blocks = 1;
        int velocity = std::clamp(int(note.recognitionValues[0]), 1, 127);
        uint64_t low = 0, high = 255 * uint64_t(blocks);
        while (low < high) {
            uint64_t middle = (low + high) / 2;
            if (velocityFromLevel(float(middle) / float(blocks)) >= velocity) high = middle;
            else low = middle + 1;
        }
        note.volumeSum = low > UINT32_MAX ? UINT32_MAX : uint32_t(low);
    }
}

// The song takes the notes read: parts named, notes in time order, the time axis of a song of
// notes only, volumes, the output's instrument, names and modes, and the song window.
static int finishImport(const std::string& path, NoteReading& reading) {
    MidiImport& m = midiImport;
    removeEmptyParts();
    // The rename of a bass part to "Double bass" belongs to the score layout, which this
    // program does not have.
    for (int p = 0; p < m.partCount; p++) m.parts[p].name = generalMidiName(m.parts[p].program + 1);
    std::stable_sort(noteList.notes, noteList.notes + noteList.count,
                     [](const Note& a, const Note& b) { return a.midiStart < b.midiStart; });
    bool notesOnly = song.blockCount == 0;
    if (notesOnly && !makeNotesTimeAxis()) {
        resetNoteList();
        resetMidiImport();
        return 0;
    }
    setNoteVolumes();

    m.sourcePath = path;
    if (m.partCount > 0) song.instrumentName = m.parts[0].name;
    else if (reading.firstChannel >= 0)
        song.instrumentName = generalMidiName(reading.channelProgram[reading.firstChannel] + 1);
    midiOutputSong.partCount = std::max(1, m.partCount);
    if (notesOnly) {
        setSongNamesFromFile(path);
        // A song of notes only has nothing to play or save as a wave. No playback runs to
        // pause: the song was empty, or notes only, which play in MIDI mode.
        displayModes.playbackMode = PLAYBACK_MODE_MIDI;
        globalSettings.playbackMode = PLAYBACK_MODE_MIDI;
    }
    songWindowHooks.showSongView();
    songWindowHooks.redrawSongView();
    songWindowHooks.updateFrameDisplay();
    return 1;
}

// ---- the file ----

// The whole file into bytes. 1; 0 after a message.
static int readWholeFile(const std::string& path, std::vector<uint8_t>& bytes) {
    int64_t size = fileSize(path);
    FILE* file = size >= 0 ? fileOpen(path, "rb") : nullptr;
    if (!file) {
        int error = size >= 0 ? errno : (folderExists(path) ? EISDIR : ENOENT);
        showMessage(MESSAGE_ERROR, "Cannot " + path + "\n\n" + std::strerror(error) + ".");
        return 0;
    }
    if (size > MAX_MIDI_FILE_BYTES) {
        fileClose(file);
        showMessage(MESSAGE_ERROR, std::string(MIDI_FILE_UNREADABLE_TEXT) + "\n\n" + path + ": it is larger than " +
                                       std::to_string(MAX_MIDI_FILE_BYTES >> 20) + " MB.");
        return 0;
    }
    if (!tryResize(bytes, size_t(size))) {
        fileClose(file);
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    size_t read = size > 0 ? fileRead(bytes.data(), bytes.size(), file) : 0;
    fileClose(file);
    if (read != bytes.size()) {
        showMessage(MESSAGE_ERROR, "Cannot " + path + "\n\nThe file could not be read to its end.");
        return 0;
    }
    return 1;
}

static void refuse(const std::string& path, const char* text, const std::string& reason) {
    showMessage(MESSAGE_ERROR, std::string(text) + "\n\n" + path + ": " + reason + ".");
}

int importMidiFile(const std::string& path) {
    // The worker of a recording or an opening is building the note list.
    if (refuseWhileBusy()) return 0;
    std::vector<uint8_t> bytes;
    if (!readWholeFile(path, bytes)) return 0;
    const uint8_t* b = bytes.data();
    if (bytes.size() < 4 || std::memcmp(b, "MThd", 4) != 0) {
        refuse(path, NOT_A_MIDI_FILE_TEXT, "it does not begin with \"MThd\"");
        return 0;
    }
    if (bytes.size() < size_t(HEADER_BYTES)) {
        refuse(path, MIDI_FILE_UNREADABLE_TEXT, "its header is cut short");
        return 0;
    }
    uint32_t headerLength = bigEndian32(b + 4);
    int format = b[8] << 8 | b[9];
    int trackCount = b[10] << 8 | b[11];
    int8_t divisionHigh = int8_t(b[12]);
    uint8_t divisionLow = b[13];
    std::string reason;
    if (headerLength != 6) reason = "its header is " + std::to_string(headerLength) + " bytes long, not 6";
    else if (trackCount == 0) reason = "it holds no tracks";
    else if (format > 2) reason = "its format is " + std::to_string(format) + ", not 0, 1 or 2";
    // A division of 0 ticks would put every event after the first at an infinite time.
    else if (divisionHigh >= 0 && (divisionHigh << 8 | divisionLow) == 0) reason = "its time division is 0";
    else if (divisionHigh < 0 && divisionLow == 0) reason = "its time division has 0 ticks per frame";
    if (!reason.empty()) {
        refuse(path, MIDI_FILE_UNREADABLE_TEXT, reason);
        return 0;
    }

    NoteReading* reading = allocationAllowed() ? new (std::nothrow) NoteReading{} : nullptr;
    if (!reading) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    std::unique_ptr<NoteReading> owner(reading);
    MidiTimeBase& base = reading->base;
    base.smpte = divisionHigh < 0;
    if (base.smpte) {
        double frames = divisionHigh == -29 ? DROP_FRAME_RATE : double(-divisionHigh);
        base.ticksPerSecond = frames * divisionLow;
    } else {
        base.ticksPerQuarter = double(divisionHigh << 8 | divisionLow);
    }
    reading->tempoPerTrack = format == 2;
    bool timed = tryAllocate([&] {
        reading->trackTempos = readTempos(bytes);
        // The tempo map of formats 0 and 1 is the whole file's, wherever a change sits.
        if (!reading->tempoPerTrack)
            for (const std::vector<TempoChange>& changes : reading->trackTempos)
                base.tempos.insert(base.tempos.end(), changes.begin(), changes.end());
    });
    if (!timed) {
        showMessage(MESSAGE_ERROR, resourceString(10401));
        return 0;
    }
    // Stable: of two changes at one tick the later one in the file rules.
    std::stable_sort(base.tempos.begin(), base.tempos.end(),
                     [](const TempoChange& x, const TempoChange& y) { return x.tick < y.tick; });
    timeTempos(base);

    // From here on the song's notes are the file's.
    if (song.notesOnly) resetSong();
    if (song.blockCount == 0) resetNoteList();
    noteList.count = 0;
    resetSelection();
    resetMidiImport();
    midiImport.partCount = std::min(trackCount - 1, MAX_MIDI_PARTS);
    for (int p = 0; p < midiImport.partCount; p++) midiImport.parts[p] = MidiPart{0, MIDI_PART_DEFAULT_NAME, 0};
    reading->firstChannel = -1;

    int step = readNotes(bytes, *reading);
    if (!finishImport(path, *reading)) return 0;
    if (step == STEP_BAD) {
        refuse(path, MIDI_FILE_UNREADABLE_TEXT, reading->reason);
        return 0;
    }
    return 1;
}
