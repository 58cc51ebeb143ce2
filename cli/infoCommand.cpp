// melodrift-cli info FILE: the format, size and duration of a wave file as the reader sees
// it, or the message a user would get when opening a file the program refuses.
#include "cli/cliCommands.h"

#include <cstdio>

#include "audio/waveFile.h"

static const char* formatTagName(uint16_t tag) {
    switch (tag) {
    case 1: return "PCM";
    case 2: return "ADPCM";
    case 3: return "IEEE float";
    case 6: return "A-law";
    case 7: return "mu-law";
    case 0xFFFE: return "extensible";
    default: return "unknown";
    }
}

int runInfoCommand(const std::vector<std::string>& arguments) {
    const std::string& path = arguments[0];
    WaveReadInfo info{};
    if (openCheckedWaveFile(&info, path) != WIO_OPENED) return 1;
    const WaveFormatRecord& format = *info.format;
    double duration = format.samplesPerSec ? double(info.dataSamples) / format.samplesPerSec : 0.0;
    std::printf("File: %s\n", path.c_str());
    std::printf("Format tag: %u (%s)\n", format.formatTag, formatTagName(format.formatTag));
    std::printf("Channels: %u\n", format.channels);
    std::printf("Sample rate: %u Hz\n", format.samplesPerSec);
    std::printf("Bits per sample: %u\n", format.bitsPerSample);
    std::printf("Data bytes: %u\n", info.dataBytes);
    std::printf("Samples: %u\n", info.dataSamples);
    std::printf("Duration: %.3f s\n", duration);
    wioFileClose(&info);
    return 0;
}
