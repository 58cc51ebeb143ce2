#pragma once
// Message boxes, Yes/No questions, the wait cursor, the status bar's second part, the
// progress window and the beep: everything the engine shows the user goes through here.
// The headless backend (the default) records every call for tests and echoes messages
// on stderr for the command-line tool; the desktop program installs its Qt backend.

#include <cstdint>
#include <string>
#include <vector>

// Every information and error box carries this title.
constexpr const char* MESSAGE_TITLE = "Message from Torvellan Melodrift";

// Kinds of box; the kind decides the icon.
enum MessageKind {
    MESSAGE_INFORMATION = 0,   // information icon, OK
    MESSAGE_ERROR = 1,         // stop icon, OK
    MESSAGE_QUESTION = 2,      // question icon, Yes/No
    MESSAGE_WARNING = 3        // warning (exclamation) icon
};

// Buttons of a box.
enum MessageButtons {
    BUTTONS_OK = 0,
    BUTTONS_YES_NO = 1
};

// Answers of a box.
enum MessageAnswer {
    ANSWER_OK = 1,
    ANSWER_YES = 6,
    ANSWER_NO = 7
};

// Shows an information or error box titled MESSAGE_TITLE.
void showMessage(int kind, const std::string& text);
// Asks a Yes/No question titled MESSAGE_TITLE with the question icon; 1 for Yes, 0 for No.
int askYesNo(const std::string& text);
// The general box: any title, any kind (icon), OK or Yes/No; returns a MessageAnswer.
int messageBox(const std::string& title, const std::string& text, int kind, int buttons);

void setWaitCursor(bool on);                      // the hourglass while a long operation runs
void setStatusText(const std::string& text);      // second part of the status bar; "" clears it
void beginProgress(const std::string& title, int total);
void stepProgress(int done);                      // done of total steps so far
void endProgress();
void beep();
// Puts a complete RIFF WAVE file on the system clipboard (as audio/wav data), replacing what
// it held. 1 when the clipboard took it.
int setClipboardWave(const std::vector<uint8_t>& riffWave);

// A backend replaces every call above. The Qt backend is installed by the desktop program.
struct UiBackend {
    int (*messageBox)(const std::string& title, const std::string& text, int kind, int buttons);
    void (*setWaitCursor)(bool on);
    void (*setStatusText)(const std::string& text);
    void (*beginProgress)(const std::string& title, int total);
    void (*stepProgress)(int done);
    void (*endProgress)();
    void (*beep)();
    int (*setClipboardWave)(const std::vector<uint8_t>& riffWave);
};
// Installs a backend; nullptr goes back to the headless one.
void setUiBackend(const UiBackend* backend);

// ---- Headless backend: the record of calls, for tests and the command-line tool ----

enum UiCallKind {
    UI_MESSAGE_BOX,
    UI_WAIT_CURSOR,
    UI_STATUS_TEXT,
    UI_PROGRESS_BEGIN,
    UI_PROGRESS_STEP,
    UI_PROGRESS_END,
    UI_BEEP,
    UI_CLIPBOARD
};

struct UiCall {
    int call;            // UiCallKind
    std::string title;   // box title or progress title
    std::string text;    // box text or status text
    int kind;            // MessageKind of a box
    int buttons;         // MessageButtons of a box
    int value;           // wait cursor on/off, progress total or step, box answer
};

const std::vector<UiCall>& uiCalls();   // every call since the last clearUiCalls()
void clearUiCalls();                    // also forgets preset answers
std::string lastMessageText();          // text of the last box shown; "" when none
int messageCount();                     // boxes shown since the last clearUiCalls()
// The bytes the last setClipboardWave put on the headless clipboard (kept across clearUiCalls).
const std::vector<uint8_t>& clipboardWave();
// Answers for the next Yes/No boxes, in order; when none are left the answer is Yes.
void presetAnswers(const std::vector<int>& answers);
// Copy every box to stderr as it is shown (the command-line tool turns this on).
void setUiEcho(bool on);
