// The operations this build has.
#include "shell/commandOperations.h"

#include "audio/openWaveFile.h"
#include "audio/recording.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "playback/playback.h"

// Filled as their owners are built.
CommandOperations commandOperations = [] {
    CommandOperations operations{};
    operations.openWaveFile = openWaveFile;
    operations.readMidiFile = importMidiFile;
    operations.writeNotesMidiFile = saveMidiFile;
    operations.toggleRecording = startRecording;
    operations.playSong = playSong;
    operations.pausePlayback = pausePlayback;
    return operations;
}();
