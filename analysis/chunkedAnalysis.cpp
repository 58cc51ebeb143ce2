// The pass over a source. The held samples run from half a top frame before the next chunk
// to the newest sample read: the frames of a chunk reach half a top frame beyond its blocks
// on both sides, so a chunk is analysed only once the source has been read half a top frame
// past it, and its blocks are then the same whatever the chunking.
#include "analysis/chunkedAnalysis.h"

#include <algorithm>
#include <cmath>
#include <ctime>
#include <vector>

#include "analysis/analysisGeometry.h"
#include "analysis/analysisSampleBuffer.h"
#include "analysis/frequencyAnalysis.h"
#include "analysis/frequencyTable.h"
#include "analysis/recognitionOptions.h"
#include "analysis/spectrogram.h"
#include "platform/allocation.h"
#include "platform/ui.h"
#include "resources/strings.h"
#include "store/ftBlockStore.h"
#include "store/hiresFTBlockStore.h"
#include "store/song.h"

static double processorSeconds() { return double(std::clock()) / CLOCKS_PER_SEC; }

static int storeBlocks(uint32_t from, uint32_t to) {
    if (ftFiles.ftFile && !rewriteFTBlocks(ftFiles.ftFile, ftFiles.ftIndexFile, from, to)) return 0;
    if (hiresFiles.hiresFile && !writeHiresFTBlocks(hiresFiles.hiresFile, hiresFiles.hiresIndexFile, from, to))
        return 0;
    return 1;
}

int analyseSource(AnalysisSampleSource source, void* sourceContext, AnalysisChunkDone done, void* doneContext,
                  ChunkedAnalysisTimes* times) {
    ChunkedAnalysisTimes spent{};
    struct ClearBuffer {
        ChunkedAnalysisTimes* times;
        const ChunkedAnalysisTimes* spent;
        ~ClearBuffer() {
            clearAnalysisSampleBuffer();
            if (times) *times = *spent;
        }
    } clearBuffer{times, &spent};
    if (!analysisBuffersReady()) return 0;
    const AnalysisGeometry& g = analysisGeometry;
    uint32_t bytesPerSample = uint32_t(g.bitsPerSample / 8);
    uint32_t chunk = g.topFrame;
    uint32_t position = uint32_t(std::trunc(songDuration() * g.sampleRate + 0.5));
    std::vector<uint8_t> held;
    int64_t heldFirst = position;
    int64_t endOfSong = -1;
    const MagnitudeSpectrogram& s = magnitudeSpectrogram;
    uint32_t frameReach = std::max(2u, recognitionOptions.lookaheadFrames) * s.binsPerRow;
    while (true) {
        if (endOfSong < 0) {
            size_t had = held.size();
            if (!tryResize(held, had + size_t(chunk) * bytesPerSample)) {
                showMessage(MESSAGE_ERROR, resourceString(10401));
                return 0;
            }
            uint32_t got = source(sourceContext, held.data() + had, chunk);
            held.resize(had + size_t(std::min(got, chunk)) * bytesPerSample);
            if (got < chunk) endOfSong = heldFirst + int64_t(held.size() / bytesPerSample);
        }
        uint32_t heldSamples = uint32_t(held.size() / bytesPerSample);
        setAnalysisSampleBuffer(held.data(), heldSamples, heldFirst, endOfSong);

        double start = processorSeconds();
        int row = createMagnitudeSpectrogram(position);
        spent.spectrogram += processorSeconds() - start;
        if (row < 0) return 0;
        while (true) {
            int64_t first, end;
            frequencyTableInput(position, &first, &end);
            if (end > analysisBufferEnd()) break;
            start = processorSeconds();
            uint32_t firstBlock = song.blockCount;
            int64_t next = createFrequencyTable(position);
            spent.tables += processorSeconds() - start;
            if (next < 0) return 0;
            if (next == int64_t(position)) break;   // no whole block left at the song's end
            start = processorSeconds();
            int stored = storeBlocks(firstBlock, song.blockCount);
            spent.storing += processorSeconds() - start;
            if (!stored) return 0;
            if (done && !done(doneContext, firstBlock, song.blockCount)) return 0;
            position = uint32_t(next);
        }
        if (endOfSong >= 0) break;

        double keep = SPECTROGRAM_KEEP_SECONDS * g.sampleRate;
        if (position > keep) dropSpectrogramRowsBefore(position - uint32_t(keep));
        // Keep what the next chunk's frames and the spectrogram's next frames reach back to.
        int64_t spectrogramEnd = int64_t(s.firstRowPosition) + int64_t(s.rowCount) * s.hop;
        if (s.rowCount == 0) spectrogramEnd = position;
        int64_t keepFrom = std::min(int64_t(position) - g.topFrame / 2, spectrogramEnd - frameReach);
        if (keepFrom > heldFirst) {
            size_t drop = size_t(std::min<int64_t>(keepFrom - heldFirst, heldSamples));
            held.erase(held.begin(), held.begin() + ptrdiff_t(drop * bytesPerSample));
            heldFirst += int64_t(drop);
        }
    }
    return 1;
}
