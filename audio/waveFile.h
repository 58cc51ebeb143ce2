#pragma once
// Reading RIFF WAVE files: the chunk walk that finds a file's format, data and sample count
// (wioFileOpen), the check of what the program can read, and the reduction of interleaved
// frames to one channel while a file is read. Used by the opening path, the recorder, the
// writers of CS.fw and the command-line tool; fuzzed by tools/fuzz.

#include <cstdint>
#include <cstdio>
#include <string>

// The body of a "fmt " chunk, decoded from its little-endian bytes. A chunk shorter than
// 18 bytes leaves the missing fields 0, so extraSize can always be read.
struct WaveFormatRecord {
    uint16_t formatTag;        // 1 = PCM; anything else is a compressed or float format
    uint16_t channels;         // interleaved channels
    uint32_t samplesPerSec;    // Hz
    uint32_t avgBytesPerSec;   // samplesPerSec x blockAlign
    uint16_t blockAlign;       // bytes per frame = channels x bitsPerSample / 8
    uint16_t bitsPerSample;    // 8 (unsigned, silence 0x80) or 16 (signed, silence 0)
    uint16_t extraSize;        // only for formatTag != 1: extra bytes after the record
};

constexpr uint16_t WAVE_FORMAT_PCM = 1;
constexpr uint32_t WAVE_UNKNOWN = 0xFFFFFFFF;   // sample count or fact offset not (yet) known
// A "fmt " chunk larger than this is not a format record; refused before it is allocated.
constexpr uint32_t MAX_WAVE_FORMAT_BYTES = 65536;

// What wioFileOpen learns about a file. wioFileOpen fills it afresh, so a record that still
// owns a file must be closed first; it must not be copied while it owns a file or a format.
struct WaveReadInfo {
    uint32_t flags;              // caller's flags (always 0)
    FILE* file;                  // open for reading, at no particular position; closed by wioFileClose
    uint32_t dataOffset;         // file offset of the first sample byte
    uint32_t dataBytes;          // size of the data chunk, cut to what the file holds
    uint32_t dataSamples;        // frames: the fact value, else dataBytes / blockAlign; never more
                                 // than dataBytes / blockAlign; WAVE_UNKNOWN until known
    uint32_t dataSizeOffset;     // file offset of the data chunk's size field; WAVE_UNKNOWN if none
    uint32_t factValueOffset;    // file offset of the fact chunk's value; WAVE_UNKNOWN if none
    WaveFormatRecord* format;    // owned: the first "fmt " chunk; nullptr until read; freed by wioFileClose
};

// Result codes of wioFileOpen (and, for WIO_NOT_PCM and WAVE_TOO_MANY_CHANNELS, of
// checkWaveFileFormat).
enum WioResult {
    WIO_OPENED = 0,               // opened: the record is filled and the file is open
    WIO_NO_FORMAT = 1,            // no "fmt " chunk
    WIO_NO_RECORD = 4,            // no record given
    WIO_CANNOT_READ = 6,          // cannot open, not a RIFF WAVE file, or the format could not be read
    WIO_NO_MEMORY = 7,            // no memory for the format
    WIO_DECLINED = 8,             // the user declined to load a file with an over-long chunk
    WIO_NOT_PCM = 12,             // not PCM without a fact chunk (checkWaveFileFormat: not 8/16-bit PCM)
    WAVE_TOO_MANY_CHANNELS = 13   // checkWaveFileFormat only: more than MAX_WAVE_CHANNELS channels
};

constexpr uint16_t MAX_WAVE_CHANNELS = 16;

// Opens path for buffered reading, walks its chunks and fills info. A chunk reaching past
// the RIFF chunk's declared size asks the user (Yes goes on, No gives WIO_DECLINED). On any
// code but WIO_OPENED the file is closed and the format freed before returning.
uint32_t wioFileOpen(WaveReadInfo* info, const std::string& path, uint32_t flags);
// Closes the file if open and frees the format; 0, or WIO_NO_RECORD for a null record.
uint32_t wioFileClose(WaveReadInfo* info);

// Whether the program can take the samples of an opened file: WIO_OPENED for PCM of one to
// 16 channels, 8 or 16 bits, block align = channels x bits / 8 and a rate above 0;
// WAVE_TOO_MANY_CHANNELS for more channels; WIO_NOT_PCM for anything else (compressed or
// float formats even with a fact chunk, 24- and 32-bit PCM, inconsistent records).
// The highest rate the program analyses is the opening path's own check.
uint32_t checkWaveFileFormat(const WaveReadInfo& info);
// The text the user reads when a file is refused with code (from wioFileOpen or
// checkWaveFileFormat); "" for WIO_OPENED.
std::string waveOpenMessage(uint32_t code);
// Opens a user's wave file for reading its samples: wioFileOpen, then checkWaveFileFormat.
// On any code but WIO_OPENED the file is closed and, unless the user declined it at the
// over-long chunk question, its opening message is shown. Returns the code.
uint32_t openCheckedWaveFile(WaveReadInfo* info, const std::string& path);

// Reads from the current position of file as many whole frames of format as give
// outputBytes bytes of one-channel output, each frame reduced to the mean of its channels
// (8 bits: sum / channels truncated; 16 bits: truncated towards zero), into destination.
// Exactly outputBytes bytes are written: what the file does not hold (its end, a partial
// last frame) becomes silence. A multi-channel format of other sizes than 8 or 16 bits
// leaves the destination as it was. Returns the output bytes that came from the file.
uint32_t downmixFrames(FILE* file, const WaveFormatRecord& format, void* destination, uint32_t outputBytes);

// An opened wave file as a source of one-channel samples for the analysis: the open file,
// positioned in its data, and the frames of its data chunk not read yet.
struct WaveFrameSource {
    WaveReadInfo* info;
    uint32_t samplesLeft;
};
// The analysis' sample reader over a WaveFrameSource (context): up to count downmixed samples
// into destination; the number read, 0 at the end of the data.
uint32_t readWaveFrameSource(void* context, uint8_t* destination, uint32_t count);
