#pragma once
// The mains hum table: the nine frequencies of the 50 Hz and 60 Hz families with the flags
// each recognition pass recomputes from the recent blocks. Entries near a frequency with the
// hum flag are hum: the pitch decision, the band energies and the later passes ignore them.

#include <cstdint>

constexpr int MAINS_HUM_FREQUENCIES = 9;
constexpr double HUM_MIN_SONG_SECONDS = 2.0;   // shorter stretches cannot tell hum from a held note

// The song's recent stretch the scan looks at, the windows it is cut into, and the longest
// absence a steady hum may show. A held note rarely fills every half second of eight seconds,
// while hum does; the analysis' level bytes are relative to the block's loudest energy, so a
// hum under loud singing can drop out for a moment without ceasing to be steady.
constexpr double HUM_SCAN_SECONDS = 8.0;
constexpr double HUM_WINDOW_SECONDS = 0.5;
constexpr double HUM_STEADY_GAP_SECONDS = 0.25;

struct MainsHumEntry {
    uint16_t frequency;   // Hz
    bool hum;             // entries within a quarter semitone of frequency are hum
    bool steady;          // never absent longer than HUM_STEADY_GAP_SECONDS during the scan
    bool present;         // in at least half of the blocks of every scan window
};

struct MainsHumTable {
    MainsHumEntry entries[MAINS_HUM_FREQUENCIES];   // 50, 100, 150, 200, 250, 60, 120, 180, 240 Hz
    bool anyHum;                                    // some entry has the hum flag
};
extern MainsHumTable mainsHumTable;

// Clears every flag (the start of each pass, and a song closing).
void clearMainsHum();
// Clears the flags, then, when the window holds more than HUM_MIN_SONG_SECONDS of song before
// endBlock, scans the origDataBuffers of the last HUM_SCAN_SECONDS of it and sets the present
// and steady flags; a family (frequencies divisible by 50, by 60) with a steady member or with
// more than one present member gets the hum flag on every member.
void scanMainsHum(uint32_t endBlock);
// 1 when frequency lies within a quarter semitone of a frequency with the hum flag.
int isHumFrequency(double frequency);
