// The headless message loop: a queue of posted calls and quit messages, the auto-reset
// capture notification event, and window timers, all served on the thread that runs the
// loop. The functions of platform/mainloop.h dispatch to an installed backend when there is one.
#include "platform/mainloop.h"

#include <chrono>
#include <condition_variable>
#include <deque>
#include <map>
#include <mutex>

#include "platform/clock.h"

static const MainLoopBackend* installedBackend = nullptr;   // nullptr: headless

struct LoopMessage {
    bool quit;                     // the quit message
    int exitCode;                  // its exit code
    std::function<void()> call;    // a posted call otherwise
};

struct LoopTimer {
    int intervalMs;                // period
    uint32_t due;                  // clock reading of the next call
    std::function<void()> call;
};

struct HeadlessLoop {
    std::mutex lock;                       // guards everything below
    std::condition_variable wake;          // posted message or event
    std::deque<LoopMessage> messages;      // in posting order
    bool captureEvent = false;             // auto-reset: cleared when served
    void (*captureHandler)() = nullptr;    // set by the recorder
    std::map<int, LoopTimer> timers;       // by id
};
static HeadlessLoop loop;

static void headlessPost(std::function<void()> call) {
    {
        std::lock_guard<std::mutex> guard(loop.lock);
        loop.messages.push_back(LoopMessage{false, 0, std::move(call)});
    }
    loop.wake.notify_all();
}

static void headlessPostQuit(int exitCode) {
    {
        std::lock_guard<std::mutex> guard(loop.lock);
        loop.messages.push_back(LoopMessage{true, exitCode, nullptr});
    }
    loop.wake.notify_all();
}

static void headlessSignal() {
    {
        std::lock_guard<std::mutex> guard(loop.lock);
        loop.captureEvent = true;
    }
    loop.wake.notify_all();
}

static void headlessStartTimer(int id, int intervalMs, std::function<void()> call) {
    std::lock_guard<std::mutex> guard(loop.lock);
    if (intervalMs < 1) intervalMs = 1;
    loop.timers[id] = LoopTimer{intervalMs, clockMilliseconds() + uint32_t(intervalMs), std::move(call)};
}

static void headlessStopTimer(int id) {
    std::lock_guard<std::mutex> guard(loop.lock);
    loop.timers.erase(id);
}

// Serves the event, then every message waiting now, then the due timers. Returns the number
// served; sets *quitSeen and *exitCode when the quit message came up (and stops there, so
// the messages behind it stay in the queue).
static int serveWaiting(bool* quitSeen, int* exitCode) {
    int served = 0;
    void (*handler)() = nullptr;
    {
        std::lock_guard<std::mutex> guard(loop.lock);
        if (loop.captureEvent) {
            loop.captureEvent = false;
            handler = loop.captureHandler;
            served++;
        }
    }
    if (handler) handler();

    size_t waiting;
    {
        std::lock_guard<std::mutex> guard(loop.lock);
        waiting = loop.messages.size();
    }
    for (size_t i = 0; i < waiting; i++) {
        LoopMessage message;
        {
            std::lock_guard<std::mutex> guard(loop.lock);
            if (loop.messages.empty()) break;
            message = std::move(loop.messages.front());
            loop.messages.pop_front();
        }
        served++;
        if (message.quit) {
            *quitSeen = true;
            *exitCode = message.exitCode;
            return served;
        }
        if (message.call) message.call();
    }

    std::vector<int> due;
    {
        std::lock_guard<std::mutex> guard(loop.lock);
        uint32_t now = clockMilliseconds();
        for (auto& [id, timer] : loop.timers)
            if (int32_t(now - timer.due) >= 0) due.push_back(id);
    }
    for (int id : due) {
        std::function<void()> call;
        {
            std::lock_guard<std::mutex> guard(loop.lock);
            auto it = loop.timers.find(id);
            if (it == loop.timers.end()) continue;   // stopped by an earlier timer's call
            it->second.due = clockMilliseconds() + uint32_t(it->second.intervalMs);
            call = it->second.call;
        }
        served++;
        if (call) call();
    }
    return served;
}

static int headlessRun(volatile uint32_t* quitFlag) {
    while (*quitFlag == 0) {
        {
            std::unique_lock<std::mutex> guard(loop.lock);
            // Sleep until something arrives, or until the next timer is due; at most 10 ms at a
            // time so that a stopped test clock is noticed.
            uint32_t now = clockMilliseconds();
            int sleepMs = 10;
            for (auto& [id, timer] : loop.timers) {
                int left = int32_t(timer.due - now);
                if (left < sleepMs) sleepMs = left < 0 ? 0 : left;
            }
            loop.wake.wait_for(guard, std::chrono::milliseconds(sleepMs),
                               [] { return loop.captureEvent || !loop.messages.empty(); });
        }
        bool quitSeen = false;
        int exitCode = 0;
        serveWaiting(&quitSeen, &exitCode);
        if (quitSeen) {
            *quitFlag = 1;
            return exitCode;
        }
    }
    return 0;
}

static const MainLoopBackend headlessBackend = {headlessPost,       headlessPostQuit, headlessSignal,
                                                headlessStartTimer, headlessStopTimer, headlessRun, nullptr};

static const MainLoopBackend& backend() { return installedBackend ? *installedBackend : headlessBackend; }

void postToMainLoop(std::function<void()> call) { backend().post(std::move(call)); }
void postQuit(int exitCode) { backend().postQuit(exitCode); }
void signalCaptureEvent() { backend().signalCaptureEvent(); }

void setCaptureEventHandler(void (*handler)()) {
    std::lock_guard<std::mutex> guard(loop.lock);
    loop.captureHandler = handler;
}

void (*captureEventHandler())() {
    std::lock_guard<std::mutex> guard(loop.lock);
    return loop.captureHandler;
}

void startTimer(int id, int intervalMs, std::function<void()> call) {
    backend().startTimer(id, intervalMs, std::move(call));
}

void stopTimer(int id) { backend().stopTimer(id); }

void stopAllTimers() {
    if (installedBackend && installedBackend->stopAllTimers) installedBackend->stopAllTimers();
    std::lock_guard<std::mutex> guard(loop.lock);
    loop.timers.clear();
}

int runMainLoop(volatile uint32_t* quitFlag) { return backend().run(quitFlag); }

int serveMainLoopOnce() {
    bool quitSeen = false;
    int exitCode = 0;
    return serveWaiting(&quitSeen, &exitCode);
}

void resetMainLoop() {
    std::lock_guard<std::mutex> guard(loop.lock);
    loop.messages.clear();
    loop.timers.clear();
    loop.captureEvent = false;
}

void setMainLoopBackend(const MainLoopBackend* backendToUse) { installedBackend = backendToUse; }
