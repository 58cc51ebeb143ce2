// The timer registry. The timers themselves are the main loop's; an entry's timer, when due,
// serves its window with the key it was claimed with.
#include "shell/appTimers.h"

#include "platform/mainloop.h"
#include "platform/ui.h"

AppTimers appTimers = {{}, 0, 1};

static bool sameEntry(const ClaimedEvent& e, int kind, int window, int key, EventCallback callback) {
    return e.kind == kind && e.window == window && e.key == key && e.callback == callback;
}

static bool idInUse(int id) {
    for (int i = 0; i < appTimers.count; i++)
        if (appTimers.events[i].id == id) return true;
    return false;
}

// The counter wraps after MAX_EVENT_ID. An id still held by a live entry is passed over:
// two entries with one id would share one main-loop timer, and releasing either would stop
// the other's.
static int takeNextId() {
    int id;
    do {
        id = appTimers.nextId;
        appTimers.nextId = id >= MAX_EVENT_ID ? 1 : id + 1;
    } while (idInUse(id));
    return id;
}

int claimEvent(int kind, int window, int key, EventCallback callback) {
    releaseEvent(kind, window, key, callback);
    if (appTimers.count >= MAX_CLAIMED_EVENTS) {
        showMessage(MESSAGE_ERROR, "Maximum number of claimed events has been reached!");
        return 0;
    }
    // The id is taken before the slot counts as live, so the slot's old contents are not
    // mistaken for an entry holding an id.
    int id = takeNextId();
    ClaimedEvent& entry = appTimers.events[appTimers.count++];
    entry = ClaimedEvent{kind, window, key, callback, id};
    if (kind == EVENT_WINDOW_TIMER)
        startTimer(EVENT_TIMER_ID_BASE + entry.id, EVENT_TIMER_PERIOD_MS,
                   [window, key] { serveTimerEvents(window, key); });
    return 1;
}

int releaseEvent(int kind, int window, int key, EventCallback callback) {
    for (int i = 0; i < appTimers.count; i++) {
        if (!sameEntry(appTimers.events[i], kind, window, key, callback)) continue;
        if (kind == EVENT_WINDOW_TIMER) stopTimer(EVENT_TIMER_ID_BASE + appTimers.events[i].id);
        for (int j = i + 1; j < appTimers.count; j++) appTimers.events[j - 1] = appTimers.events[j];
        appTimers.count--;
        return 1;
    }
    return 0;
}

int serveTimerEvents(int window, int key) {
    // A callback may claim or release entries: the matching ones are collected first, and
    // one released by an earlier callback of this round is not called.
    ClaimedEvent due[MAX_CLAIMED_EVENTS];
    int dueCount = 0;
    for (int i = 0; i < appTimers.count; i++) {
        const ClaimedEvent& e = appTimers.events[i];
        if (e.kind != EVENT_WINDOW_TIMER) continue;
        if (e.window != window && e.window != EVENT_WILDCARD) continue;
        if (e.key != key && e.key != EVENT_WILDCARD) continue;
        due[dueCount++] = e;
    }
    int made = 0;
    for (int i = 0; i < dueCount; i++) {
        if (!due[i].callback || !idInUse(due[i].id)) continue;
        due[i].callback(due[i].id);
        made++;
    }
    return made;
}

void resetAppTimers() {
    for (int i = 0; i < appTimers.count; i++)
        if (appTimers.events[i].kind == EVENT_WINDOW_TIMER) stopTimer(EVENT_TIMER_ID_BASE + appTimers.events[i].id);
    appTimers.count = 0;
    appTimers.nextId = 1;
}
