#pragma once
// The platform's sound backends over PulseAudio (and FluidSynth for the sequencer). The
// desktop program and the command-line tool install them; the tests and the headless tool
// keep the null ones unless a test asks for these.

#include <cstdint>

// Playback devices (platform/media.h) through the server's default sink.
void installPulseMedia();
// Capture (platform/capture.h) from the server's default source.
void installPulseCapture();
// The mixer (platform/mixer.h): the server's sources, the default one and its volume.
void installPulseMixer();

// What a benchmark reads of the last device played: process clock milliseconds when its play
// was asked for and when its first samples were handed to the server; 0 until then.
struct PulseMediaTimes {
    uint32_t playAsked;
    uint32_t firstWrite;
};
PulseMediaTimes lastPulseMediaTimes();
