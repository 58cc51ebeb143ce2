#pragma once
// The main frame's command dispatch: every menu command and accelerator comes here by id,
// passes the modal-state filter, repeats its operation's guard and calls the operation.
// Commands that need a window of their own (dialogs, the child windows, leaving) go back
// to the desktop program. The entry points of operations other modules own are collected
// in commandOperations, so that a command reaches its operation once its owner is built.

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

// Results of dispatchCommand.
enum CommandResult {
    COMMAND_DONE = 0,        // handled here (an operation that did nothing by its guard included)
    COMMAND_FOR_FRAME = 1,   // the desktop program handles it: Open, Close, Save, Save As, Exit,
                             // the Window and Help commands, the preferences
    COMMAND_FILTERED = 2     // dropped: the frame is modal, or the id is no command of ours
};
int dispatchCommand(int command);

// "<command> is not available in this version of Torvellan Melodrift." for a command
// whose operation this build does not have.
void reportNotAvailable(int command);
std::string notAvailableText(const std::string& what);
