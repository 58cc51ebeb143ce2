#pragma once
// The application timer registry: at most 128 claimed events, each a kind, a window, a key,
// a callback and an id. A claimed 10 ms window timer calls back every matching entry with
// its id. Playback claims its cursor timer here, and the song view its own timers.

// Kinds of claimed event.
constexpr int EVENT_WINDOW_TIMER = 0;     // a 10 ms timer started on the entry's window
// A window or key of an entry that matches any window or key when the timer is served.
constexpr int EVENT_WILDCARD = 99;
constexpr int MAX_CLAIMED_EVENTS = 128;
constexpr int EVENT_TIMER_PERIOD_MS = 10;
// Ids run 1 .. MAX_EVENT_ID, then start again at 1.
constexpr int MAX_EVENT_ID = 65536;
// The main loop's timer id of the entry with id n is EVENT_TIMER_ID_BASE + n, clear of the
// program's other timers.
constexpr int EVENT_TIMER_ID_BASE = 0x100000;
// Window numbers of the program's windows that serve timers.
constexpr int SONG_VIEW_WINDOW = 1;       // the song view's drawing window

typedef void (*EventCallback)(int id);

struct ClaimedEvent {
    int kind;                 // EVENT_WINDOW_TIMER
    int window;               // window number, or EVENT_WILDCARD
    int key;                  // the claimer's key, or EVENT_WILDCARD
    EventCallback callback;   // called with id
    int id;                   // from the id counter
};

struct AppTimers {
    ClaimedEvent events[MAX_CLAIMED_EVENTS];   // events[0 .. count-1] in claiming order
    int count;                                 // entries in use
    int nextId;                                // id of the next claim, 1 .. MAX_EVENT_ID
};
extern AppTimers appTimers;

// Releases an entry equal in all four values, then appends a new one with the next id; a
// window timer is started for it. 1 when claimed; 0 when the table is full, after "Maximum
// number of claimed events has been reached!".
int claimEvent(int kind, int window, int key, EventCallback callback);
// Removes the entry equal in all four values, stopping its timer; later entries move up.
// 1 when one was found, else 0.
int releaseEvent(int kind, int window, int key, EventCallback callback);
// What a window does when one of its timers is due: calls the callback of every window-timer
// entry whose window is window or EVENT_WILDCARD and whose key is key or EVENT_WILDCARD,
// passing the entry's id. Returns the number of callbacks made.
int serveTimerEvents(int window, int key);
// Stops every timer and empties the table; ids start again at 1.
void resetAppTimers();
