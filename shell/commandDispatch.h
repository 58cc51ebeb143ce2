#pragma once
// The main frame's command dispatch: every menu command and accelerator comes here by id,
// passes the modal-state filter, repeats its operation's guard and calls the operation.
// Commands that need a window of their own (dialogs, the child windows, leaving) go back
// to the desktop program. The entry points of operations other modules own are collected
// in commandOperations (shell/commandOperations.h).

#include <string>

#include "shell/commandOperations.h"

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
