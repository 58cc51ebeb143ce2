#pragma once
// The program's one message loop. It waits for posted calls, due timers and the capture
// notification event (an auto-reset event the capture buffer signals), serves the event
// on the main thread, and ends at the quit message, even when more calls wait behind it.
// The headless backend is used by the command-line tool and the tests; the desktop program
// installs the Qt backend.

#include <cstdint>
#include <functional>

// Posts a call to run on the main thread; safe from any thread.
void postToMainLoop(std::function<void()> call);
// Posts the quit message carrying the exit code; calls posted before it still run.
void postQuit(int exitCode);
// Signals the capture notification event (auto-reset); safe from any thread.
void signalCaptureEvent();
// The handler called on the main thread when the capture event is signalled.
void setCaptureEventHandler(void (*handler)());
// The handler set last; a backend serving the event calls it.
void (*captureEventHandler())();

// Window timers: call every intervalMs (the program's timers run every 10 ms) until stopped. Starting an
// id that runs restarts it.
void startTimer(int id, int intervalMs, std::function<void()> call);
void stopTimer(int id);
void stopAllTimers();

// Runs the loop while *quitFlag is 0. The quit message sets *quitFlag to 1 and leaves at
// once; the result is the quit message's exit code (0 when the flag was set otherwise).
int runMainLoop(volatile uint32_t* quitFlag);
// Tests: serves what is waiting now (event, due timers, posted calls) without blocking;
// returns the number of items served.
int serveMainLoopOnce();
// Drops every posted call, timer and pending event (between tests, and at shut-down).
void resetMainLoop();

struct MainLoopBackend {
    void (*post)(std::function<void()> call);
    void (*postQuit)(int exitCode);
    void (*signalCaptureEvent)();
    void (*startTimer)(int id, int intervalMs, std::function<void()> call);
    void (*stopTimer)(int id);
    int (*run)(volatile uint32_t* quitFlag);
    void (*stopAllTimers)();   // may be null: stopAllTimers() then stops only the headless timers
};
// Installs a backend; nullptr goes back to the headless loop.
void setMainLoopBackend(const MainLoopBackend* backend);
