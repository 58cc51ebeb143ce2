// The operations this build has.
#include "shell/commandOperations.h"

#include "audio/openWaveFile.h"
#include "audio/recording.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "playback/playback.h"
#include "notes/songViewInput.h"
#include "playback/midiOutput.h"
#include "store/timeEditing.h"
#include "store/undo.h"

// Filled as their owners are built.
CommandOperations commandOperations = [] {
    CommandOperations operations{};
    operations.openWaveFile = openWaveFile;
    operations.readMidiFile = importMidiFile;
    operations.writeNotesMidiFile = saveMidiFile;
    operations.toggleRecording = startRecording;
    operations.playSong = playSong;
    operations.pausePlayback = pausePlayback;
    operations.handleSongViewCode = handleSongViewCode;
    operations.canUndo = canUndo;
    operations.canRedo = canRedo;
    operations.clipboardKind = [] { return timeClipboard.kind; };
    return operations;
}();
