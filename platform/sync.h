#pragma once
// The program's four named mutexes, and a worker thread that can suspend itself and be
// resumed by another thread. Lock order: wait for the undo snapshot writer before taking
// any of these and never while holding CSAccessWaveFileMutex; take CSWaveProcessingMutex
// before CSAccessWaveFileMutex.

#include <condition_variable>
#include <functional>
#include <mutex>
#include <thread>

extern std::mutex CSWaveProcessingMutex;      // one chunk of recording or opening work at a time
extern std::mutex CSRecordCapturedDataMutex;  // created with the others; no operation takes it
extern std::mutex CSAccessWaveFileMutex;      // the wave working file CS.fw while it is plain
extern std::mutex CSAccessHiresFTFileMutex;   // the Hires FT files and the undo writer's busy state

// The mutexes are process objects; these mark their creation and closing at start-up and
// shut-down, so that the engine can tell whether they are open.
void createNamedMutexes();
void closeNamedMutexes();
bool namedMutexesCreated();

// A worker thread that suspends itself when it has caught up and is resumed from another
// thread. A resume that arrives before the suspend is kept, so the worker never sleeps
// through a wake-up.
struct SuspendableWorker {
    std::thread thread;               // running while started and not yet joined
    std::mutex lock;                  // guards the two flags below
    std::condition_variable wake;     // signalled by resumeWorker and stopWorker
    bool resumePending = false;       // a resume not yet consumed by suspendWorker
    bool stopRequested = false;       // set by requestWorkerStop; the worker ends its loop
};

enum WorkerPriority { WORKER_PRIORITY_BELOW_NORMAL = -1, WORKER_PRIORITY_NORMAL = 0, WORKER_PRIORITY_ABOVE_NORMAL = 1 };

void startWorker(SuspendableWorker& worker, std::function<void()> body);
// Called by the worker itself: sleeps until resumed or asked to stop. Returns at once when
// a resume is pending.
void suspendWorker(SuspendableWorker& worker);
void resumeWorker(SuspendableWorker& worker);
void requestWorkerStop(SuspendableWorker& worker);   // also wakes a suspended worker
bool workerStopRequested(SuspendableWorker& worker);
void joinWorker(SuspendableWorker& worker);           // waits for the thread; resets the flags
// Best effort: changes the thread's scheduling niceness; 1 when applied, 0 otherwise.
int setWorkerPriority(SuspendableWorker& worker, int priority);
