#pragma once
// The open queue: the files chosen in the Open dialog or named on the desktop program's
// command line, opened one after the other. A wave file goes to the opening operation; the
// next file waits until that opening has finished.

#include <deque>
#include <string>
#include <vector>

// At most this many files are queued from one choice.
constexpr int MAX_OPEN_FILES = 400;
// The main loop's timer that looks again while an opening runs, and its period.
constexpr int OPEN_QUEUE_TIMER_ID = 0x0F0001;
constexpr int OPEN_QUEUE_POLL_MS = 100;

struct OpenQueue {
    std::deque<std::string> paths;   // files still to open, in the order chosen
    bool waiting;                    // the poll timer runs: an opening is in progress
};
extern OpenQueue openQueue;

// Appends the first MAX_OPEN_FILES of paths to the queue (telling the user when more were
// chosen) and returns the number queued.
int queueFilesToOpen(const std::vector<std::string>& paths);
// Opens queued files in order until the queue is empty or an opening is running; in the
// latter case it comes back every OPEN_QUEUE_POLL_MS until that opening has finished.
void workOffOpenQueue();
// Empties the queue and stops its timer.
void resetOpenQueue();
