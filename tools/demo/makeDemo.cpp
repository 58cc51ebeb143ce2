// makeDemo: composes the bundled demo melody, renders it with FluidSynth and a General MIDI
// soundfont to a mono 16-bit 44,100 Hz wave, and writes beside it the melody's notes as CSV
// (onset_s,offset_s,midi_pitch, seconds in the wave's time) for checking note recognition, and
// optionally the melody as a Standard MIDI File. The build runs it to make demo/ in the build
// tree; the same soundfont gives the same bytes on every run.
//
//   makeDemo OUT.wav [--truth OUT.csv] [--midi OUT.mid] [--soundfont SF2]

#include <fluidsynth.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

constexpr int SAMPLE_RATE = 44100;        // frames per second, output and synth
constexpr int PPQ = 480;                  // MIDI ticks per quarter note
constexpr int TEMPO_BPM = 100;            // quarter notes per minute
constexpr int EIGHTH = PPQ / 2;           // ticks
constexpr int CHANNEL = 0;                // MIDI channel, zero-based
constexpr int PROGRAM = 53;               // General MIDI "Voice Oohs", zero-based
constexpr int VOLUME = 100;               // CC7
constexpr double LEAD_SILENCE = 0.3;      // seconds of silence before the first note
constexpr double TRAIL_SILENCE = 0.5;     // seconds of silence after the last note has died away
constexpr double RELEASE_LIMIT = 2.0;     // seconds rendered after the last note-off at most
constexpr double TAIL_FLOOR = 0.001;      // the release ends where it falls below this part of the peak
constexpr double PEAK = 0.7;              // peak of the written wave, part of full scale
constexpr double SYNTH_GAIN = 2.8;        // puts the mix's peak near -3 dBFS before normalising

// Vibrato on long notes: the modulation wheel swells in after the onset and is
// reset at the note-off (the default CC1 modulator gives 50 cents of vibrato at 127).
constexpr int VIBRATO_DELAY = EIGHTH / 2;  // ticks after the onset
constexpr int VIBRATO_RAMP = EIGHTH;       // ticks from 0 to full depth
constexpr int VIBRATO_STEP = 30;           // ticks between wheel values
constexpr int VIBRATO_DEPTH = 64;          // CC1 value at full depth

static const char* const SOUNDFONTS[] = {
    "/usr/share/sounds/sf2/TimGM6mb.sf2",
    "/usr/share/sounds/sf2/default-GM.sf2",
    "/usr/share/sounds/sf2/FluidR3_GM.sf2",
};

enum Articulation {
    LEGATO,    // held until the next note starts
    TENUTO,    // held for 90 % of its length
    DETACHED,  // held for 75 % of its length, so a repeated note is heard twice
};

struct ScoreNote {
    int pitch;          // MIDI note number; 0 is a rest
    int eighths;        // length in eighth notes
    int velocity;       // 1..127
    Articulation articulation;  // how much of its length the note is held
    bool vibrato;       // modulation wheel swells in on this note
};

// Our own phrase in C major, six bars of 4/4 at 100 bpm, C4 to A4 (crotchets unless marked):
// C E G(minim) | A(dotted) G(quaver) F E | D D A(minim) | G F(quaver) E(quaver) D (rest) |
// E C A G | E(quaver) D(quaver) C(dotted minim)
static const ScoreNote SCORE[] = {
    {60, 2, 84, LEGATO, false},   {64, 2, 88, LEGATO, false},   {67, 4, 96, TENUTO, true},
    {69, 3, 100, LEGATO, false},  {67, 1, 88, LEGATO, false},   {65, 2, 86, LEGATO, false},
    {64, 2, 84, DETACHED, false},
    {62, 2, 86, DETACHED, false}, {62, 2, 90, DETACHED, false}, {69, 4, 104, TENUTO, true},
    {67, 2, 96, LEGATO, false},   {65, 1, 90, LEGATO, false},   {64, 1, 88, LEGATO, false},
    {62, 2, 84, TENUTO, false},   {0, 2, 0, LEGATO, false},
    {64, 2, 90, DETACHED, false}, {60, 2, 86, LEGATO, false},   {69, 2, 100, LEGATO, false},
    {67, 2, 94, LEGATO, false},
    {64, 1, 90, LEGATO, false},   {62, 1, 86, LEGATO, false},   {60, 6, 88, TENUTO, true},
};

struct MelodyNote {
    int on;         // ticks
    int off;        // ticks
    int pitch;      // MIDI note number
    int velocity;   // 1..127
    bool vibrato;   // modulation wheel swells in while the note is held
};

struct MidiEvent {
    int tick;       // ticks from the start
    int order;      // among events at one tick: note-offs, then controllers, then note-ons
    uint8_t status; // MIDI status byte with the channel
    uint8_t data1;  // key, controller or program
    uint8_t data2;  // velocity or controller value; unused for a program change
};

static std::vector<MelodyNote> melodyNotes() {
    std::vector<MelodyNote> notes;
    int tick = 0;
    for (const ScoreNote& s : SCORE) {
        int length = s.eighths * EIGHTH;
        if (s.pitch) {
            int held = length;
            if (s.articulation == TENUTO) held = length * 9 / 10;
            if (s.articulation == DETACHED) held = length * 3 / 4;
            notes.push_back({tick, tick + held, s.pitch, s.velocity, s.vibrato});
        }
        tick += length;
    }
    return notes;
}

static std::vector<MidiEvent> melodyEvents(const std::vector<MelodyNote>& notes) {
    std::vector<MidiEvent> events;
    events.push_back({0, 1, uint8_t(0xC0 | CHANNEL), PROGRAM, 0});
    events.push_back({0, 1, uint8_t(0xB0 | CHANNEL), 7, VOLUME});
    events.push_back({0, 1, uint8_t(0xB0 | CHANNEL), 1, 0});
    for (const MelodyNote& n : notes) {
        events.push_back({n.on, 2, uint8_t(0x90 | CHANNEL), uint8_t(n.pitch), uint8_t(n.velocity)});
        events.push_back({n.off, 0, uint8_t(0x80 | CHANNEL), uint8_t(n.pitch), 64});
        if (!n.vibrato) continue;
        for (int t = 0; t <= VIBRATO_RAMP; t += VIBRATO_STEP) {
            int tick = n.on + VIBRATO_DELAY + t;
            if (tick >= n.off) break;
            uint8_t wheel = uint8_t(VIBRATO_DEPTH * t / VIBRATO_RAMP);
            events.push_back({tick, 1, uint8_t(0xB0 | CHANNEL), 1, wheel});
        }
        events.push_back({n.off, 1, uint8_t(0xB0 | CHANNEL), 1, 0});
    }
    std::stable_sort(events.begin(), events.end(), [](const MidiEvent& a, const MidiEvent& b) {
        return a.tick != b.tick ? a.tick < b.tick : a.order < b.order;
    });
    return events;
}

static double tickSeconds(int tick) {
    return tick * 60.0 / (double(TEMPO_BPM) * PPQ);
}

static int64_t tickFrame(int tick) {
    // Rounded to the nearest frame in integers, so no platform's floating point moves an event.
    int64_t num = int64_t(tick) * 60 * SAMPLE_RATE;
    int64_t den = int64_t(TEMPO_BPM) * PPQ;
    return (num + den / 2) / den;
}

// Closes explicitly so a failed flush is reported; 1 when written.
static int writeFile(const std::string& path, const std::vector<uint8_t>& bytes) {
    FILE* f = std::fopen(path.c_str(), "wb");
    if (!f) {
        std::fprintf(stderr, "makeDemo: cannot write %s: %s\n", path.c_str(), std::strerror(errno));
        return 0;
    }
    bool ok = std::fwrite(bytes.data(), 1, bytes.size(), f) == bytes.size();
    ok = std::fclose(f) == 0 && ok;
    if (!ok) {
        std::fprintf(stderr, "makeDemo: writing %s failed: %s\n", path.c_str(), std::strerror(errno));
        return 0;
    }
    return 1;
}

static void putBE(std::vector<uint8_t>& out, uint32_t value, int bytes) {
    for (int i = bytes - 1; i >= 0; i--) out.push_back(uint8_t(value >> (8 * i)));
}

static void putLE(std::vector<uint8_t>& out, uint32_t value, int bytes) {
    for (int i = 0; i < bytes; i++) out.push_back(uint8_t(value >> (8 * i)));
}

static void putVarLen(std::vector<uint8_t>& out, uint32_t value) {
    uint8_t groups[5];
    int n = 0;
    do {
        groups[n++] = value & 0x7F;
        value >>= 7;
    } while (value);
    while (n > 1) out.push_back(uint8_t(groups[--n] | 0x80));
    out.push_back(groups[0]);
}

// Format 0: one track with tempo, metre, name and the channel events.
static std::vector<uint8_t> midiFileBytes(const std::vector<MidiEvent>& events) {
    std::vector<uint8_t> track;
    const char name[] = "Melodrift demo melody";
    track.insert(track.end(), {0x00, 0xFF, 0x03, uint8_t(sizeof name - 1)});
    track.insert(track.end(), name, name + sizeof name - 1);
    track.insert(track.end(), {0x00, 0xFF, 0x51, 0x03});
    putBE(track, 60000000 / TEMPO_BPM, 3);
    track.insert(track.end(), {0x00, 0xFF, 0x58, 0x04, 4, 2, 24, 8});
    int last = 0;
    for (const MidiEvent& e : events) {
        putVarLen(track, uint32_t(e.tick - last));
        last = e.tick;
        track.push_back(e.status);
        track.push_back(e.data1);
        if ((e.status & 0xF0) != 0xC0) track.push_back(e.data2);
    }
    track.insert(track.end(), {0x00, 0xFF, 0x2F, 0x00});

    std::vector<uint8_t> out = {'M', 'T', 'h', 'd'};
    putBE(out, 6, 4);
    putBE(out, 0, 2);
    putBE(out, 1, 2);
    putBE(out, PPQ, 2);
    out.insert(out.end(), {'M', 'T', 'r', 'k'});
    putBE(out, uint32_t(track.size()), 4);
    out.insert(out.end(), track.begin(), track.end());
    return out;
}

static std::vector<uint8_t> waveFileBytes(const std::vector<int16_t>& samples) {
    uint32_t dataBytes = uint32_t(samples.size() * 2);
    std::vector<uint8_t> out = {'R', 'I', 'F', 'F'};
    putLE(out, 36 + dataBytes, 4);
    out.insert(out.end(), {'W', 'A', 'V', 'E', 'f', 'm', 't', ' '});
    putLE(out, 16, 4);
    putLE(out, 1, 2);                 // PCM
    putLE(out, 1, 2);                 // mono
    putLE(out, SAMPLE_RATE, 4);
    putLE(out, SAMPLE_RATE * 2, 4);   // bytes per second
    putLE(out, 2, 2);                 // bytes per frame
    putLE(out, 16, 2);                // bits per sample
    out.insert(out.end(), {'d', 'a', 't', 'a'});
    putLE(out, dataBytes, 4);
    for (int16_t s : samples) putLE(out, uint16_t(s), 2);
    return out;
}

static std::vector<uint8_t> truthBytes(const std::vector<MelodyNote>& notes) {
    std::string text = "onset_s,offset_s,midi_pitch\n";
    char line[64];
    for (const MelodyNote& n : notes) {
        std::snprintf(line, sizeof line, "%.4f,%.4f,%d\n", LEAD_SILENCE + tickSeconds(n.on),
                      LEAD_SILENCE + tickSeconds(n.off), n.pitch);
        text += line;
    }
    return std::vector<uint8_t>(text.begin(), text.end());
}

// FluidSynth's first error since the last clear, shown after our own message instead of before it.
static std::string fluidError;

static void keepFluidError(int, const char* message, void*) {
    if (fluidError.empty() && message) fluidError = message;
}

static void reportFluidFailure(const std::string& what) {
    if (fluidError.empty())
        std::fprintf(stderr, "makeDemo: %s\n", what.c_str());
    else
        std::fprintf(stderr, "makeDemo: %s (FluidSynth: %s)\n", what.c_str(), fluidError.c_str());
    fluidError.clear();
}

static bool readable(const std::string& path) {
    FILE* f = std::fopen(path.c_str(), "rb");
    if (!f) return false;
    std::fclose(f);
    return true;
}

// Renders the events and mixes to mono; empty on failure, after saying why.
static std::vector<float> renderMono(const std::vector<MidiEvent>& events, const std::string& soundfont) {
    auto deleteSettings = [](fluid_settings_t* s) { delete_fluid_settings(s); };
    auto deleteSynth = [](fluid_synth_t* s) { delete_fluid_synth(s); };
    std::unique_ptr<fluid_settings_t, decltype(deleteSettings)> settings(new_fluid_settings(),
                                                                          deleteSettings);
    if (!settings) {
        reportFluidFailure("FluidSynth could not create its settings");
        return {};
    }
    // Reverb and chorus off and one rendering thread: the output then depends only on
    // the events and the soundfont.
    fluid_settings_setnum(settings.get(), "synth.sample-rate", SAMPLE_RATE);
    fluid_settings_setnum(settings.get(), "synth.gain", SYNTH_GAIN);
    fluid_settings_setint(settings.get(), "synth.reverb.active", 0);
    fluid_settings_setint(settings.get(), "synth.chorus.active", 0);
    fluid_settings_setint(settings.get(), "synth.cpu-cores", 1);
    fluid_settings_setint(settings.get(), "synth.lock-memory", 0);
    std::unique_ptr<fluid_synth_t, decltype(deleteSynth)> synth(new_fluid_synth(settings.get()),
                                                                 deleteSynth);
    if (!synth) {
        reportFluidFailure("FluidSynth could not create a synthesizer");
        return {};
    }
    // Checked first: a file that is no RIFF file at all is then refused without trying every loader.
    if (!fluid_is_soundfont(soundfont.c_str())
        || fluid_synth_sfload(synth.get(), soundfont.c_str(), 1) == FLUID_FAILED) {
        reportFluidFailure(soundfont + " is not a soundfont FluidSynth can load");
        return {};
    }

    int64_t lastOff = tickFrame(events.back().tick);
    int64_t end = lastOff + int64_t(RELEASE_LIMIT * SAMPLE_RATE);
    std::vector<float> left(static_cast<size_t>(end)), right(static_cast<size_t>(end));
    int64_t done = 0;
    size_t next = 0;
    while (done < end) {
        // Events take effect at the synth's next 64-frame block, at most 1.5 ms late.
        while (next < events.size() && tickFrame(events[next].tick) <= done) {
            const MidiEvent& e = events[next++];
            switch (e.status & 0xF0) {
            case 0x80: fluid_synth_noteoff(synth.get(), CHANNEL, e.data1); break;
            case 0x90: fluid_synth_noteon(synth.get(), CHANNEL, e.data1, e.data2); break;
            case 0xB0: fluid_synth_cc(synth.get(), CHANNEL, e.data1, e.data2); break;
            case 0xC0:
                if (fluid_synth_program_change(synth.get(), CHANNEL, e.data1) == FLUID_FAILED) {
                    reportFluidFailure(soundfont + " has no General MIDI program "
                                       + std::to_string(e.data1 + 1));
                    return {};
                }
                break;
            }
        }
        int64_t until = next < events.size() ? std::min(end, tickFrame(events[next].tick)) : end;
        int len = int(std::min<int64_t>(until - done, 4096));
        if (fluid_synth_write_float(synth.get(), len, left.data(), int(done), 1, right.data(), int(done), 1)
            == FLUID_FAILED) {
            reportFluidFailure("FluidSynth failed to render");
            return {};
        }
        done += len;
    }

    std::vector<float> mono(left.size());
    for (size_t i = 0; i < mono.size(); i++) mono[i] = 0.5f * (left[i] + right[i]);
    return mono;
}

// Trims the release where it has died away, scales to PEAK and adds the silences.
static std::vector<int16_t> finishedSamples(const std::vector<float>& mono) {
    float peak = 0;
    for (float v : mono) peak = std::max(peak, std::fabs(v));
    if (peak == 0) return {};
    size_t used = mono.size();
    while (used > 0 && std::fabs(mono[used - 1]) < TAIL_FLOOR * peak) used--;

    size_t lead = size_t(std::lround(LEAD_SILENCE * SAMPLE_RATE));
    size_t trail = size_t(std::lround(TRAIL_SILENCE * SAMPLE_RATE));
    std::vector<int16_t> out(lead + used + trail, 0);
    double scale = PEAK * 32767.0 / peak;
    for (size_t i = 0; i < used; i++) out[lead + i] = int16_t(std::lrint(mono[i] * scale));
    return out;
}

static void printUsage() {
    std::fprintf(stderr, "usage: makeDemo OUT.wav [--truth OUT.csv] [--midi OUT.mid] [--soundfont SF2]\n");
}

int main(int argc, char** argv) {
    std::string wavePath, truthPath, midiPath, soundfont;
    for (int i = 1; i < argc; i++) {
        std::string arg = argv[i];
        if (arg == "--truth" || arg == "--midi" || arg == "--soundfont") {
            if (i + 1 >= argc) {
                std::fprintf(stderr, "makeDemo: %s needs a file name\n", arg.c_str());
                printUsage();
                return 2;
            }
            std::string& target = arg == "--truth" ? truthPath : arg == "--midi" ? midiPath : soundfont;
            target = argv[++i];
        } else if (arg == "-h" || arg == "--help") {
            printUsage();
            return 0;
        } else if (arg.size() > 1 && arg[0] == '-') {
            std::fprintf(stderr, "makeDemo: unknown option %s\n", arg.c_str());
            printUsage();
            return 2;
        } else if (wavePath.empty()) {
            wavePath = arg;
        } else {
            std::fprintf(stderr, "makeDemo: more than one output wave given (%s)\n", arg.c_str());
            printUsage();
            return 2;
        }
    }
    if (wavePath.empty()) {
        printUsage();
        return 2;
    }
    if (truthPath.empty()) {
        std::string stem = wavePath;
        if (stem.size() > 4 && stem.compare(stem.size() - 4, 4, ".wav") == 0) stem.resize(stem.size() - 4);
        truthPath = stem + ".notes.csv";
    }

    if (!soundfont.empty()) {
        if (!readable(soundfont)) {
            std::fprintf(stderr, "makeDemo: cannot read soundfont %s: %s\n", soundfont.c_str(),
                         std::strerror(errno));
            return 1;
        }
    } else {
        for (const char* candidate : SOUNDFONTS) {
            if (readable(candidate)) {
                soundfont = candidate;
                break;
            }
        }
        if (soundfont.empty()) {
            std::fprintf(stderr,
                         "makeDemo: no General MIDI soundfont found in /usr/share/sounds/sf2/; install the "
                         "Debian package timgm6mb-soundfont, or name a soundfont with --soundfont SF2\n");
            return 1;
        }
    }

    // Warnings and chatter from FluidSynth would bury our own messages; its errors are kept for them.
    fluid_set_log_function(FLUID_PANIC, keepFluidError, nullptr);
    fluid_set_log_function(FLUID_ERR, keepFluidError, nullptr);
    fluid_set_log_function(FLUID_WARN, nullptr, nullptr);
    fluid_set_log_function(FLUID_INFO, nullptr, nullptr);
    fluid_set_log_function(FLUID_DBG, nullptr, nullptr);

    std::vector<MelodyNote> notes = melodyNotes();
    std::vector<MidiEvent> events = melodyEvents(notes);
    std::vector<float> mono = renderMono(events, soundfont);
    if (mono.empty()) return 1;
    std::vector<int16_t> samples = finishedSamples(mono);
    if (samples.empty()) {
        std::fprintf(stderr, "makeDemo: %s rendered the melody as silence\n", soundfont.c_str());
        return 1;
    }

    if (!writeFile(wavePath, waveFileBytes(samples))) return 1;
    if (!writeFile(truthPath, truthBytes(notes))) return 1;
    if (!midiPath.empty() && !writeFile(midiPath, midiFileBytes(events))) return 1;
    std::printf("makeDemo: %s, %.2f s, %zu notes, rendered with %s\n", wavePath.c_str(),
                double(samples.size()) / SAMPLE_RATE, notes.size(), soundfont.c_str());
    return 0;
}
