// The mains hum scan. Only the pitch-bin entries as the analysis made them are scanned (the
// origDataBuffers), so a pass sees the same hum whether or not earlier passes already reduced
// the blocks to their pitch.
#include "analysis/mainsHum.h"

#include "analysis/recognitionBlocks.h"
#include "analysis/recognitionOptions.h"
#include "store/song.h"

MainsHumTable mainsHumTable;

static const uint16_t HUM_FREQUENCIES[MAINS_HUM_FREQUENCIES] = {50, 100, 150, 200, 250, 60, 120, 180, 240};

void clearMainsHum() {
    for (int i = 0; i < MAINS_HUM_FREQUENCIES; i++) mainsHumTable.entries[i] = {HUM_FREQUENCIES[i], false, false, false};
    mainsHumTable.anyHum = false;
}

static bool blockHolds(uint32_t block, double frequency) {
    const FTDataBuffer& data = blockOrigData(block);
    for (uint32_t i = 0; i < data.nEntries; i++)
        if (data.entries[i].amplitude && nearFrequency(data.entries[i].frequency, frequency, QUARTER_SEMITONE_TOLERANCE))
            return true;
    return false;
}

void scanMainsHum(uint32_t endBlock) {
    clearMainsHum();
    const FTBlockWindow& w = ftBlockWindow;
    if (endBlock > w.endBlock) endBlock = w.endBlock;
    if (endBlock <= w.firstBlock) return;
    if (songTimeOfBlock(endBlock, w.firstBlock) <= HUM_MIN_SONG_SECONDS) return;
    uint32_t scanBlocks = uint32_t(blocksForSeconds(HUM_SCAN_SECONDS));
    uint32_t first = endBlock - w.firstBlock > scanBlocks ? endBlock - scanBlocks : w.firstBlock;
    uint32_t window = uint32_t(blocksForSeconds(HUM_WINDOW_SECONDS));
    uint32_t longestGap = uint32_t(blocksForSeconds(HUM_STEADY_GAP_SECONDS));
    if (window == 0) window = 1;
    for (MainsHumEntry& e : mainsHumTable.entries) {
        bool present = true;
        uint32_t gap = 0, widestGap = 0;
        // Whole windows from the scan's start; a remainder shorter than a window joins the last.
        for (uint32_t start = first; start < endBlock;) {
            uint32_t end = endBlock - start < 2 * window ? endBlock : start + window;
            uint32_t held = 0;
            for (uint32_t b = start; b < end; b++) {
                if (blockHolds(b, e.frequency)) {
                    held++;
                    gap = 0;
                } else if (++gap > widestGap) {
                    widestGap = gap;
                }
            }
            if (2 * held < end - start) present = false;
            start = end;
        }
        e.present = present;
        e.steady = present && widestGap <= longestGap;
    }
    for (int family : {50, 60}) {
        int steady = 0, present = 0;
        for (const MainsHumEntry& e : mainsHumTable.entries)
            if (e.frequency % family == 0) {
                steady += e.steady;
                present += e.present;
            }
        if (steady < 1 && present <= 1) continue;
        for (MainsHumEntry& e : mainsHumTable.entries)
            if (e.frequency % family == 0) e.hum = true;
        mainsHumTable.anyHum = true;
    }
}

int isHumFrequency(double frequency) {
    if (!mainsHumTable.anyHum) return 0;
    for (const MainsHumEntry& e : mainsHumTable.entries)
        if (e.hum && nearFrequency(frequency, e.frequency, QUARTER_SEMITONE_TOLERANCE)) return 1;
    return 0;
}
