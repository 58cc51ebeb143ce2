// The headless user interface: every call is recorded for the tests, Yes/No questions are
// answered from a preset list, and (for the command-line tool) boxes are echoed on stderr.
// The functions of platform/ui.h dispatch to an installed backend when there is one.
#include "platform/ui.h"

#include <cstdio>
#include <deque>
#include <mutex>

static const UiBackend* installedBackend = nullptr;   // nullptr: headless

// A class name is shared by the whole program: one used again elsewhere (a test fixture) would
// share this one's inline constructor, so the state classes of this layer end in "State".
struct HeadlessUiState {
    std::mutex lock;                  // the worker threads report too
    std::vector<UiCall> calls;        // every call since clearUiCalls
    std::deque<int> answers;          // preset answers of the next Yes/No boxes
    bool echo = false;                // copy boxes to stderr
    std::vector<uint8_t> clipboard;   // the system clipboard's wave
};
static HeadlessUiState headlessUi;

static const char* kindWord(int kind) {
    switch (kind) {
    case MESSAGE_ERROR: return "error";
    case MESSAGE_QUESTION: return "question";
    case MESSAGE_WARNING: return "warning";
    default: return "message";
    }
}

static void record(const UiCall& call) {
    std::lock_guard<std::mutex> guard(headlessUi.lock);
    headlessUi.calls.push_back(call);
}

static int headlessMessageBox(const std::string& title, const std::string& text, int kind, int buttons) {
    int answer = ANSWER_OK;
    {
        std::lock_guard<std::mutex> guard(headlessUi.lock);
        if (buttons == BUTTONS_YES_NO) {
            answer = ANSWER_YES;
            if (!headlessUi.answers.empty()) {
                answer = headlessUi.answers.front();
                headlessUi.answers.pop_front();
            }
        }
        headlessUi.calls.push_back(UiCall{UI_MESSAGE_BOX, title, text, kind, buttons, answer});
        if (headlessUi.echo) {
            std::fprintf(stderr, "%s (%s): %s\n", title.c_str(), kindWord(kind), text.c_str());
            if (buttons == BUTTONS_YES_NO) std::fprintf(stderr, "  -> %s\n", answer == ANSWER_YES ? "Yes" : "No");
        }
    }
    return answer;
}

int messageBox(const std::string& title, const std::string& text, int kind, int buttons) {
    if (installedBackend) return installedBackend->messageBox(title, text, kind, buttons);
    return headlessMessageBox(title, text, kind, buttons);
}

void showMessage(int kind, const std::string& text) {
    messageBox(MESSAGE_TITLE, text, kind, BUTTONS_OK);
}

int askYesNo(const std::string& text) {
    return messageBox(MESSAGE_TITLE, text, MESSAGE_QUESTION, BUTTONS_YES_NO) == ANSWER_YES ? 1 : 0;
}

void setWaitCursor(bool on) {
    if (installedBackend) return installedBackend->setWaitCursor(on);
    record(UiCall{UI_WAIT_CURSOR, "", "", 0, 0, on ? 1 : 0});
}

void setStatusText(const std::string& text) {
    if (installedBackend) return installedBackend->setStatusText(text);
    record(UiCall{UI_STATUS_TEXT, "", text, 0, 0, 0});
}

void beginProgress(const std::string& title, int total) {
    if (installedBackend) return installedBackend->beginProgress(title, total);
    record(UiCall{UI_PROGRESS_BEGIN, title, "", 0, 0, total});
}

void stepProgress(int done) {
    if (installedBackend) return installedBackend->stepProgress(done);
    record(UiCall{UI_PROGRESS_STEP, "", "", 0, 0, done});
}

void endProgress() {
    if (installedBackend) return installedBackend->endProgress();
    record(UiCall{UI_PROGRESS_END, "", "", 0, 0, 0});
}

void beep() {
    if (installedBackend) return installedBackend->beep();
    record(UiCall{UI_BEEP, "", "", 0, 0, 0});
    if (headlessUi.echo) std::fprintf(stderr, "%s (beep): nothing to do\n", MESSAGE_TITLE);
}

int setClipboardWave(const std::vector<uint8_t>& riffWave) {
    if (installedBackend) return installedBackend->setClipboardWave(riffWave);
    std::lock_guard<std::mutex> guard(headlessUi.lock);
    headlessUi.clipboard = riffWave;
    headlessUi.calls.push_back(UiCall{UI_CLIPBOARD, "", "", 0, 0, int(riffWave.size())});
    return 1;
}

const std::vector<uint8_t>& clipboardWave() { return headlessUi.clipboard; }

void setUiBackend(const UiBackend* backend) { installedBackend = backend; }

const std::vector<UiCall>& uiCalls() { return headlessUi.calls; }

void clearUiCalls() {
    std::lock_guard<std::mutex> guard(headlessUi.lock);
    headlessUi.calls.clear();
    headlessUi.answers.clear();
}

std::string lastMessageText() {
    std::lock_guard<std::mutex> guard(headlessUi.lock);
    for (auto it = headlessUi.calls.rbegin(); it != headlessUi.calls.rend(); ++it)
        if (it->call == UI_MESSAGE_BOX) return it->text;
    return "";
}

int messageCount() {
    std::lock_guard<std::mutex> guard(headlessUi.lock);
    int count = 0;
    for (const UiCall& call : headlessUi.calls)
        if (call.call == UI_MESSAGE_BOX) count++;
    return count;
}

void presetAnswers(const std::vector<int>& answers) {
    std::lock_guard<std::mutex> guard(headlessUi.lock);
    headlessUi.answers.assign(answers.begin(), answers.end());
}

void setUiEcho(bool on) { headlessUi.echo = on; }
