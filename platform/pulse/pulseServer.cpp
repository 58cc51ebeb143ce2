// The shared PulseAudio connection. The loop thread lives as long as the process; the
// context is replaced when it has failed (the server was stopped or restarted).
#include "platform/pulse/pulseServer.h"

#include <mutex>

struct PulseServer {
    std::once_flag started;                 // the loop is made and started once
    pa_threaded_mainloop* loop = nullptr;   // runs every callback
    pa_context* context = nullptr;          // nullptr until the first connection
};
static PulseServer server;

pa_threaded_mainloop* pulseMainLoop() {
    std::call_once(server.started, [] {
        server.loop = pa_threaded_mainloop_new();
        if (server.loop) pa_threaded_mainloop_start(server.loop);
    });
    return server.loop;
}

PulseLock::PulseLock() {
    if (pa_threaded_mainloop* loop = pulseMainLoop()) pa_threaded_mainloop_lock(loop);
}

PulseLock::~PulseLock() {
    if (server.loop) pa_threaded_mainloop_unlock(server.loop);
}

void pulseSignal() {
    if (server.loop) pa_threaded_mainloop_signal(server.loop, 0);
}

static void wakeOnTimeout(pa_mainloop_api*, pa_time_event*, const struct timeval*, void* flag) {
    *static_cast<bool*>(flag) = true;
    pulseSignal();
}

// A time event that sets *flag after timeoutMs; freed by the caller.
static pa_time_event* armTimeout(int timeoutMs, bool* flag) {
    struct timeval due;
    pa_gettimeofday(&due);
    pa_timeval_add(&due, pa_usec_t(timeoutMs) * PA_USEC_PER_MSEC);
    pa_mainloop_api* api = pa_threaded_mainloop_get_api(server.loop);
    return api->time_new(api, &due, wakeOnTimeout, flag);
}

static void freeTimeout(pa_time_event* event) {
    pa_mainloop_api* api = pa_threaded_mainloop_get_api(server.loop);
    if (event) api->time_free(event);
}

void pulseWait(int timeoutMs) {
    if (!server.loop) return;
    bool timedOut = false;
    pa_time_event* event = armTimeout(timeoutMs, &timedOut);
    pa_threaded_mainloop_wait(server.loop);
    freeTimeout(event);
}

static void contextChanged(pa_context*, void*) { pulseSignal(); }

pa_context* pulseContext() {
    if (!server.loop) return nullptr;
    if (server.context && pa_context_get_state(server.context) == PA_CONTEXT_READY) return server.context;
    if (server.context) {
        pa_context_set_state_callback(server.context, nullptr, nullptr);
        pa_context_disconnect(server.context);
        pa_context_unref(server.context);
        server.context = nullptr;
    }
    pa_context* context = pa_context_new(pa_threaded_mainloop_get_api(server.loop), "Torvellan Melodrift");
    if (!context) return nullptr;
    pa_context_set_state_callback(context, contextChanged, nullptr);
    // Never start a server of our own: without one the program says so.
    if (pa_context_connect(context, nullptr, PA_CONTEXT_NOAUTOSPAWN, nullptr) < 0) {
        pa_context_unref(context);
        return nullptr;
    }
    bool timedOut = false;
    pa_time_event* event = armTimeout(PULSE_TIMEOUT_MS, &timedOut);
    pa_context_state_t state;
    while ((state = pa_context_get_state(context)) != PA_CONTEXT_READY && PA_CONTEXT_IS_GOOD(state) && !timedOut)
        pa_threaded_mainloop_wait(server.loop);
    freeTimeout(event);
    server.context = context;   // kept even when failed, for its error text
    return state == PA_CONTEXT_READY ? context : nullptr;
}

static void operationChanged(pa_operation*, void*) { pulseSignal(); }

int pulseWaitFor(pa_operation* op) {
    if (!op) return 0;
    pa_operation_set_state_callback(op, operationChanged, nullptr);
    bool timedOut = false;
    pa_time_event* event = armTimeout(PULSE_TIMEOUT_MS, &timedOut);
    while (pa_operation_get_state(op) == PA_OPERATION_RUNNING && !timedOut) pa_threaded_mainloop_wait(server.loop);
    freeTimeout(event);
    bool done = pa_operation_get_state(op) == PA_OPERATION_DONE;
    if (!done) pa_operation_cancel(op);
    pa_operation_unref(op);
    return done ? 1 : 0;
}

std::string pulseLastError() {
    int error = server.context ? pa_context_errno(server.context) : PA_ERR_CONNECTIONREFUSED;
    return pa_strerror(error);
}
