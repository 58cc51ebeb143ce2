#pragma once
// A small Standard MIDI File reader of the tests' own, sharing nothing with the writer: it
// takes a file apart strictly (chunk lengths, end-of-track last, no running status, data bytes
// below 0x80) and pairs note-ons with note-offs, timing them in seconds through the file's
// tempo events. The MIDI output suites read what the writer wrote with it.

#include <cstdint>
#include <map>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

struct ReadMidiEvent {
    uint32_t tick = 0;             // absolute, from the track's start
    uint8_t status = 0;            // 0xFF for a meta event
    uint8_t data1 = 0;             // channel events: first data byte
    uint8_t data2 = 0;             // channel events with two data bytes: the second
    uint8_t metaType = 0;          // meta events: the type
    std::vector<uint8_t> metaData; // meta events: the data
};

struct ReadMidiTrack {
    std::vector<ReadMidiEvent> events;   // the end-of-track event is not among them
    uint32_t endTick = 0;                // tick of the end-of-track event
};

struct ReadMidiFile {
    std::string error;                   // empty when the file read cleanly
    int format = -1;
    int trackCount = -1;                 // as the header says
    int division = 0;
    std::vector<ReadMidiTrack> tracks;
};

struct ReadNote {
    int track = 0;
    int channel = 0;
    int key = 0;
    int velocity = 0;
    uint32_t onTick = 0;
    uint32_t offTick = 0;
    double onSeconds = 0.0;
    double offSeconds = 0.0;
};

inline ReadMidiFile readMidiBytes(const std::vector<uint8_t>& b) {
    ReadMidiFile file;
    size_t at = 0;
    auto fail = [&](const std::string& why) {
        file.error = why + " at byte " + std::to_string(at);
        return file;
    };
    auto need = [&](size_t n) { return at + n <= b.size(); };
    auto u32 = [&]() {
        uint32_t v = uint32_t(b[at]) << 24 | uint32_t(b[at + 1]) << 16 | uint32_t(b[at + 2]) << 8 | b[at + 3];
        at += 4;
        return v;
    };
    auto u16 = [&]() {
        uint32_t v = uint32_t(b[at]) << 8 | b[at + 1];
        at += 2;
        return v;
    };
    if (!need(14) || std::string(b.begin(), b.begin() + 4) != "MThd") return fail("no MThd");
    at = 4;
    if (u32() != 6) return fail("header length is not 6");
    file.format = int(u16());
    file.trackCount = int(u16());
    file.division = int(u16());
    while (at < b.size()) {
        if (!need(8)) return fail("chunk head cut short");
        std::string tag(b.begin() + long(at), b.begin() + long(at) + 4);
        at += 4;
        uint32_t length = u32();
        if (!need(length)) return fail("chunk longer than the file");
        if (tag != "MTrk") return fail("chunk '" + tag + "' is not a track");
        size_t end = at + length;
        ReadMidiTrack track;
        uint32_t tick = 0;
        bool ended = false;
        while (at < end) {
            if (ended) return fail("bytes after end of track");
            uint32_t delta = 0;
            int count = 0;
            while (true) {
                if (at >= end || ++count > 4) return fail("bad delta");
                uint8_t c = b[at++];
                delta = (delta << 7) | (c & 0x7F);
                if (!(c & 0x80)) break;
            }
            tick += delta;
            if (at >= end) return fail("event missing");
            ReadMidiEvent event;
            event.tick = tick;
            event.status = b[at++];
            if (event.status < 0x80) return fail("running status");
            if (event.status == 0xFF) {
                if (at >= end) return fail("meta type missing");
                event.metaType = b[at++];
                uint32_t metaLength = 0;
                count = 0;
                while (true) {
                    if (at >= end || ++count > 4) return fail("bad meta length");
                    uint8_t c = b[at++];
                    metaLength = (metaLength << 7) | (c & 0x7F);
                    if (!(c & 0x80)) break;
                }
                if (at + metaLength > end) return fail("meta data beyond the track");
                event.metaData.assign(b.begin() + long(at), b.begin() + long(at + metaLength));
                at += metaLength;
                if (event.metaType == 0x2F) {
                    if (metaLength != 0) return fail("end of track with data");
                    ended = true;
                    track.endTick = tick;
                    continue;
                }
            } else if (event.status >= 0xF0) {
                return fail("system event");
            } else {
                int kind = event.status & 0xF0;
                int dataCount = kind == 0xC0 || kind == 0xD0 ? 1 : 2;
                if (at + size_t(dataCount) > end) return fail("channel event cut short");
                event.data1 = b[at++];
                if (dataCount == 2) event.data2 = b[at++];
                if (event.data1 >= 0x80 || event.data2 >= 0x80) return fail("data byte with the high bit");
            }
            track.events.push_back(event);
        }
        if (!ended) return fail("track without end of track");
        file.tracks.push_back(track);
    }
    if (int(file.tracks.size()) != file.trackCount) return fail("track count differs from the header");
    return file;
}

// Seconds of a tick through the tempo events of every track (120 beats per minute before any).
inline double secondsAtTick(const ReadMidiFile& file, uint32_t tick) {
    std::map<uint32_t, uint32_t> tempos;   // tick -> microseconds per quarter
    for (const ReadMidiTrack& track : file.tracks)
        for (const ReadMidiEvent& e : track.events)
            if (e.status == 0xFF && e.metaType == 0x51 && e.metaData.size() == 3)
                tempos[e.tick] = uint32_t(e.metaData[0]) << 16 | uint32_t(e.metaData[1]) << 8 | e.metaData[2];
    double seconds = 0.0;
    uint32_t at = 0;
    uint32_t tempo = 500000;
    for (const auto& [when, value] : tempos) {
        if (when >= tick) break;
        seconds += double(when - at) * tempo / 1e6 / file.division;
        at = when;
        tempo = value;
    }
    return seconds + double(tick - at) * tempo / 1e6 / file.division;
}

// Every note of the file, in the order the notes begin (track by track). A note-on with
// velocity 0 counts as a note-off. Notes left sounding, or offs without an on, are reported
// through unmatched.
inline std::vector<ReadNote> notesOf(const ReadMidiFile& file, int* unmatched = nullptr) {
    std::vector<ReadNote> notes;
    int lost = 0;
    for (size_t t = 0; t < file.tracks.size(); t++) {
        std::map<std::pair<int, int>, size_t> sounding;   // (channel, key) -> index in notes
        for (const ReadMidiEvent& e : file.tracks[t].events) {
            int kind = e.status & 0xF0;
            if (e.status == 0xFF || (kind != 0x80 && kind != 0x90)) continue;
            std::pair<int, int> id{e.status & 0x0F, e.data1};
            bool on = kind == 0x90 && e.data2 > 0;
            auto found = sounding.find(id);
            if (on) {
                if (found != sounding.end()) lost++;
                ReadNote note;
                note.track = int(t);
                note.channel = id.first;
                note.key = id.second;
                note.velocity = e.data2;
                note.onTick = e.tick;
                note.onSeconds = secondsAtTick(file, e.tick);
                sounding[id] = notes.size();
                notes.push_back(note);
            } else if (found != sounding.end()) {
                notes[found->second].offTick = e.tick;
                notes[found->second].offSeconds = secondsAtTick(file, e.tick);
                sounding.erase(found);
            } else {
                lost++;
            }
        }
        lost += int(sounding.size());
    }
    if (unmatched) *unmatched = lost;
    return notes;
}

// Each note as (key, on tick, off tick), to compare whole songs at once.
using NoteTicks = std::tuple<int, uint32_t, uint32_t>;
inline std::vector<NoteTicks> ticksOf(const std::vector<ReadNote>& notes) {
    std::vector<NoteTicks> ticks;
    for (const ReadNote& n : notes) ticks.emplace_back(n.key, n.onTick, n.offTick);
    return ticks;
}

// The channel events of one kind (status high half) of a track, in order.
inline std::vector<ReadMidiEvent> eventsOfKind(const ReadMidiTrack& track, int kind) {
    std::vector<ReadMidiEvent> found;
    for (const ReadMidiEvent& e : track.events)
        if (e.status != 0xFF && (e.status & 0xF0) == kind) found.push_back(e);
    return found;
}
