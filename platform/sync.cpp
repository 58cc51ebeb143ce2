// The named mutexes and the suspendable worker thread.
#include "platform/sync.h"

#include <atomic>
#include <pthread.h>
#include <sched.h>

std::mutex CSWaveProcessingMutex;
std::mutex CSRecordCapturedDataMutex;
std::mutex CSAccessWaveFileMutex;
std::mutex CSAccessHiresFTFileMutex;

static std::atomic<bool> mutexesCreated{false};   // between start-up and shut-down

void createNamedMutexes() { mutexesCreated = true; }
void closeNamedMutexes() { mutexesCreated = false; }
bool namedMutexesCreated() { return mutexesCreated; }

void startWorker(SuspendableWorker& worker, std::function<void()> body) {
    {
        std::lock_guard<std::mutex> guard(worker.lock);
        worker.resumePending = false;
        worker.stopRequested = false;
    }
    worker.thread = std::thread(std::move(body));
}

void suspendWorker(SuspendableWorker& worker) {
    std::unique_lock<std::mutex> guard(worker.lock);
    worker.wake.wait(guard, [&] { return worker.resumePending || worker.stopRequested; });
    worker.resumePending = false;
}

void resumeWorker(SuspendableWorker& worker) {
    {
        std::lock_guard<std::mutex> guard(worker.lock);
        worker.resumePending = true;
    }
    worker.wake.notify_all();
}

void requestWorkerStop(SuspendableWorker& worker) {
    {
        std::lock_guard<std::mutex> guard(worker.lock);
        worker.stopRequested = true;
    }
    worker.wake.notify_all();
}

bool workerStopRequested(SuspendableWorker& worker) {
    std::lock_guard<std::mutex> guard(worker.lock);
    return worker.stopRequested;
}

void joinWorker(SuspendableWorker& worker) {
    if (worker.thread.joinable()) worker.thread.join();
    std::lock_guard<std::mutex> guard(worker.lock);
    worker.resumePending = false;
    worker.stopRequested = false;
}

int setWorkerPriority(SuspendableWorker& worker, int priority) {
    if (!worker.thread.joinable()) return 0;
    // Below normal runs the thread only when a core is otherwise idle; raising it above
    // normal needs privileges we do not ask for, so it goes back to the normal policy.
    sched_param param{};
    int policy = priority < 0 ? SCHED_IDLE : SCHED_OTHER;
    return pthread_setschedparam(worker.thread.native_handle(), policy, &param) == 0 ? 1 : 0;
}
