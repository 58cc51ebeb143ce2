// The operations this build has.
#include "shell/commandOperations.h"

#include "audio/openWaveFile.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"

// Filled as their owners are built.
CommandOperations commandOperations = [] {
    CommandOperations operations{};
    operations.openWaveFile = openWaveFile;
    operations.readMidiFile = importMidiFile;
    operations.writeNotesMidiFile = saveMidiFile;
    return operations;
}();
