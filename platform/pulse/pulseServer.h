#pragma once
// The one connection to the PulseAudio server that playback, capture and the mixer share: a
// threaded main loop (its thread runs every stream callback) and a context, made on first use
// and made again after the server went away. Never spawns a server: a machine without one
// gets a refusal within the connection time-out, not a hang.

#include <pulse/pulseaudio.h>

#include <string>

// How long a connection or a request may take before the server counts as unreachable.
constexpr int PULSE_TIMEOUT_MS = 3000;

// The main loop's lock: every call on the context or a stream is made holding it. It may be
// taken again by the thread holding it only through the loop's own callbacks.
struct PulseLock {
    PulseLock();
    ~PulseLock();
    PulseLock(const PulseLock&) = delete;
    PulseLock& operator=(const PulseLock&) = delete;
};

// With the lock held: the context, connected and ready, or nullptr when no server answers.
pa_context* pulseContext();
// With the lock held: waits (releasing the lock meanwhile) until op is done, or until the
// time-out; 1 when it completed. The operation is released either way.
int pulseWaitFor(pa_operation* op);
// With the lock held: waits for the next signal of the loop, at most timeoutMs.
void pulseWait(int timeoutMs);
// Wakes the waiters of pulseWait and pulseWaitFor (from the loop's callbacks).
void pulseSignal();
// The threaded main loop, started on first use.
pa_threaded_mainloop* pulseMainLoop();
// The server's message for the context's last error.
std::string pulseLastError();
