#pragma once
// The entry points of the operations that commands reach in other modules, collected in one
// record so that a command reaches its operation once its owner is built. The dispatch, the
// enabling rules and the frame read it.

#include <string>

// Entry points of operations owned by other modules. An owner fills its entries when it is
// built; a null entry is an operation this build does not have: its command reports that
// plainly and never pretends to have worked. Tests install stand-ins.
struct CommandOperations {
    int (*openWaveFile)(const std::string& path);      // open a wave file into the song; 1 dealt with
    int (*readMidiFile)(const std::string& path);      // read a MIDI file as the note list
    int (*toggleRecording)();                          // start, or stop, recording
    int (*handleSongViewCode)(int code);               // the song view's edit operation
    void (*playSong)(double start, double end, int preview);   // play, or stop (toggle)
    void (*pausePlayback)();                           // before a mode change
    int (*runNoteCommand)(int command);                // the Notes menu's commands, by CommandId
    int (*writeNotesMidiFile)(const std::string& path, int detail, int onlySelectedRange);   // save as MIDI; 1 written
    int (*canUndo)();                                  // an undo step exists
    int (*canRedo)();                                  // a redo step exists
    int (*clipboardKind)();                            // the time clipboard's kind; 0 when empty
};
extern CommandOperations commandOperations;
