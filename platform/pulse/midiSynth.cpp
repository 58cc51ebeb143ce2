// FluidSynth driven by the output: the player follows the samples rendered (sample timing),
// so the sound is exactly the file's timing whatever the output's pace. The synthesizer and
// its sound font are loaded once and reset for each file.
#include "platform/pulse/midiSynth.h"

#include <fluidsynth.h>

#include <cstdlib>
#include <filesystem>
#include <vector>

#include "platform/media.h"
#include "platform/mediaFiles.h"

struct MidiSynth {
    fluid_settings_t* settings = nullptr;
    fluid_synth_t* synth = nullptr;        // with the sound font loaded
    std::string soundFont;                 // the font loaded into synth
    fluid_player_t* player = nullptr;      // the open file; nullptr when none
    std::vector<uint8_t> file;             // its bytes, which the player reads
    uint64_t framesRendered = 0;           // since the file was opened
    uint64_t lastEventFrame = 0;           // the file's last event (FluidSynth's player reports its
                                           // end only seconds after the voices died away)
    int quietFrames = 0;                   // consecutive quiet frames after the last event
    int tailFrames = 0;                    // frames rendered after the last event
};
static MidiSynth midiSynth;

// FluidSynth complains on the terminal about a file that is not there; missing is no error here.
static bool isSoundFont(const char* path) {
    std::error_code error;
    return std::filesystem::is_regular_file(path, error) && fluid_is_soundfont(path);
}

std::string findSoundFont() {
    if (const char* chosen = std::getenv("MELODRIFT_SOUNDFONT")) {
        if (*chosen) return isSoundFont(chosen) ? chosen : "";
    }
    for (const char* path : {"/usr/share/sounds/sf2/default-GM.sf2", "/usr/share/sounds/sf2/TimGM6mb.sf2",
                             "/usr/share/sounds/sf2/FluidR3_GM.sf2"})
        if (isSoundFont(path)) return path;
    return "";
}

static bool loadSynth(const std::string& soundFont) {
    MidiSynth& m = midiSynth;
    if (m.synth && m.soundFont == soundFont) return true;
    if (m.synth) delete_fluid_synth(m.synth);
    if (m.settings) delete_fluid_settings(m.settings);
    m.synth = nullptr;
    // FluidSynth's warnings would land on the user's terminal.
    fluid_set_log_function(FLUID_WARN, nullptr, nullptr);
    fluid_set_log_function(FLUID_INFO, nullptr, nullptr);
    fluid_set_log_function(FLUID_DBG, nullptr, nullptr);
    m.settings = new_fluid_settings();
    if (!m.settings) return false;
    fluid_settings_setnum(m.settings, "synth.sample-rate", MIDI_SYNTH_RATE);
    fluid_settings_setnum(m.settings, "synth.gain", MIDI_SYNTH_GAIN);
    fluid_settings_setint(m.settings, "synth.lock-memory", 0);
    fluid_settings_setstr(m.settings, "player.timing-source", "sample");
    m.synth = new_fluid_synth(m.settings);
    if (!m.synth) return false;
    if (fluid_synth_sfload(m.synth, soundFont.c_str(), 1) == FLUID_FAILED) {
        delete_fluid_synth(m.synth);
        m.synth = nullptr;
        return false;
    }
    m.soundFont = soundFont;
    return true;
}

int openMidiSynth(const std::string& path) {
    MidiSynth& m = midiSynth;
    if (m.player) return MEDIA_ERROR_IN_USE;
    uint32_t milliseconds = 0;
    if (!readMidiFileDuration(path, &milliseconds)) return MEDIA_ERROR_FILE;
    std::string soundFont = findSoundFont();
    if (soundFont.empty() || !loadSynth(soundFont)) return MEDIA_ERROR_NO_SOUNDFONT;
    FILE* in = std::fopen(path.c_str(), "rb");
    if (!in) return MEDIA_ERROR_FILE;
    m.file.clear();
    uint8_t buffer[65536];
    size_t got;
    while ((got = std::fread(buffer, 1, sizeof buffer, in)) > 0) m.file.insert(m.file.end(), buffer, buffer + got);
    std::fclose(in);
    fluid_synth_system_reset(m.synth);
    m.player = new_fluid_player(m.synth);
    if (!m.player || fluid_player_add_mem(m.player, m.file.data(), m.file.size()) != FLUID_OK ||
        fluid_player_play(m.player) != FLUID_OK) {
        closeMidiSynth();
        return MEDIA_ERROR_FILE;
    }
    m.framesRendered = 0;
    m.lastEventFrame = uint64_t(milliseconds) * MIDI_SYNTH_RATE / 1000;
    m.quietFrames = 0;
    m.tailFrames = 0;
    return MEDIA_OK;
}

int renderMidiSynth(int16_t* samples, int frames) {
    MidiSynth& m = midiSynth;
    if (!m.player) return 0;
    int written = 0;
    // Small steps, so that the end of the file and of its tail is found to the step.
    const int step = 64;
    while (written < frames) {
        bool ended = m.framesRendered >= m.lastEventFrame || fluid_player_get_status(m.player) != FLUID_PLAYER_PLAYING;
        if (ended && (m.quietFrames >= MIDI_TAIL_SILENCE_FRAMES || m.tailFrames >= MIDI_TAIL_LONGEST_FRAMES)) break;
        int n = std::min(step, frames - written);
        int16_t* out = samples + 2 * written;
        fluid_synth_write_s16(m.synth, n, out, 0, 2, out, 1, 2);
        if (ended) {
            m.tailFrames += n;
            bool quiet = true;
            for (int i = 0; i < 2 * n && quiet; i++) quiet = std::abs(int(out[i])) < MIDI_TAIL_SILENCE_LEVEL;
            m.quietFrames = quiet ? m.quietFrames + n : 0;
        }
        written += n;
        m.framesRendered += uint64_t(n);
    }
    return written;
}

uint32_t midiSynthRenderedMilliseconds() { return uint32_t(midiSynth.framesRendered * 1000 / MIDI_SYNTH_RATE); }

void closeMidiSynth() {
    MidiSynth& m = midiSynth;
    if (m.player) {
        fluid_player_stop(m.player);
        delete_fluid_player(m.player);
        m.player = nullptr;
    }
    if (m.synth) fluid_synth_all_sounds_off(m.synth, -1);
    m.file.clear();
}
