#pragma once
// The sequencer's sound: a MIDI file rendered by FluidSynth with the system's General MIDI
// sound font, block by block as the output asks for it, so that playing starts at once
// however long the song. One file plays at a time, as on a MIDI output port.

#include <cstdint>
#include <string>

constexpr int MIDI_SYNTH_RATE = 44100;      // frames per second, two channels of 16 bits
// FluidSynth's default gain (0.2) leaves a sung line at about a twentieth of full scale; ten
// times that brings a melody of loud notes to about -16 dB of full scale (rms), the level of
// an ordinary vocal recording, with its peaks still below full scale.
constexpr double MIDI_SYNTH_GAIN = 2.0;
// After the last event the instrument's release and the reverb ring on until the output has
// been this quiet for this long, or at most for the longest tail.
constexpr int MIDI_TAIL_SILENCE_LEVEL = 16;         // of 32767: -66 dB
constexpr int MIDI_TAIL_SILENCE_FRAMES = MIDI_SYNTH_RATE / 10;
constexpr int MIDI_TAIL_LONGEST_FRAMES = 3 * MIDI_SYNTH_RATE;

// The sound font used: $MELODRIFT_SOUNDFONT when set, else the system's default General MIDI
// font, else TimGM6mb or FluidR3_GM; "" when none exists.
std::string findSoundFont();

// Prepares path for rendering from its start. MEDIA_OK, MEDIA_ERROR_FILE (not a MIDI file),
// MEDIA_ERROR_NO_SOUNDFONT or MEDIA_ERROR_IN_USE (another file is prepared).
int openMidiSynth(const std::string& path);
// Renders up to frames stereo frames into samples; returns the frames written, fewer than
// asked (possibly 0) once the file and its tail have ended.
int renderMidiSynth(int16_t* samples, int frames);
// Milliseconds of the file rendered so far.
uint32_t midiSynthRenderedMilliseconds();
// Ends the file: the next open may come.
void closeMidiSynth();
