#pragma once
// The mixer of the recording input: the sources the input can record from (the source
// selector), which of them records, and that source's level and on/off switch. The recording
// page of the preferences and the level meter's caption use it. Backends: PulseAudio's sources
// and their volumes (platform/pulse/), a fake mixer for tests, and none (no sources).

#include <string>
#include <vector>

struct MixerSource {
    std::string name;     // as the user knows it
    bool microphone;      // a microphone input
};

// Opens the mixer: 1 with its name in *name, 0 when there is none.
int mixerOpen(std::string* name);
void mixerClose();
// The sources and the one that records (-1 when none does). 1 read; 0 when the mixer failed.
int mixerSources(std::vector<MixerSource>* sources, int* selected);
// Makes source index the one that records. 1 done.
int mixerSelectSource(int index);
// The recording source's level control: its bounds and value. 1 read.
int mixerLevel(int* minimum, int* maximum, int* value);
int mixerSetLevel(int value);
// The recording source's on/off switch: *on; and switching it on. 1 done.
int mixerSwitch(bool* on);
int mixerSwitchOn();
// changed is called on the main thread when a source or its level changes outside the
// program; nullptr stops it.
void mixerWatch(void (*changed)());

struct MixerBackend {
    int (*open)(std::string* name);
    void (*close)();
    int (*sources)(std::vector<MixerSource>* sources, int* selected);
    int (*selectSource)(int index);
    int (*level)(int* minimum, int* maximum, int* value);
    int (*setLevel)(int value);
    int (*getSwitch)(bool* on);
    int (*switchOn)();
    void (*watch)(void (*changed)());
};
// Installs a backend; nullptr goes back to none.
void setMixerBackend(const MixerBackend* backend);

// ---- The fake mixer, for tests ----
struct FakeMixer {
    std::string name = "Fake mixer";
    std::vector<MixerSource> sources;   // with their levels and switches below, by index
    std::vector<int> levels;
    std::vector<bool> on;
    int selected = -1;
    int minimum = 0;
    int maximum = 65535;
    bool failing = false;               // every call fails
    int opens = 0;                      // open calls that found the mixer
    bool isOpen = false;
};
extern FakeMixer fakeMixer;
// Installs the fake mixer (its state as set in fakeMixer).
void installFakeMixer();
