// The headless message loop and the suspendable worker.
#include <gtest/gtest.h>

#include <atomic>
#include <thread>

#include "platform/clock.h"
#include "platform/mainloop.h"
#include "platform/sync.h"

class MainLoop : public ::testing::Test {
protected:
    void SetUp() override { resetMainLoop(); }
    void TearDown() override {
        resetMainLoop();
        setCaptureEventHandler(nullptr);
        setManualClock(false);
    }
};

TEST_F(MainLoop, QuitEndsTheLoopEvenWithCallsWaitingBehindIt) {
    std::vector<int> served;
    postToMainLoop([&] { served.push_back(1); });
    postQuit(7);
    postToMainLoop([&] { served.push_back(2); });
    volatile uint32_t quit = 0;
    EXPECT_EQ(runMainLoop(&quit), 7);
    EXPECT_EQ(quit, 1u);
    EXPECT_EQ(served, std::vector<int>{1});
    // A loop with the quit flag already set never runs.
    EXPECT_EQ(runMainLoop(&quit), 0);
    EXPECT_EQ(served, std::vector<int>{1});
}

static std::atomic<int> captureEvents{0};
static void countCaptureEvent() { captureEvents++; }

TEST_F(MainLoop, TheCaptureEventIsAutoResetAndServedOnTheLoopThread) {
    captureEvents = 0;
    setCaptureEventHandler(countCaptureEvent);
    std::thread worker([] {
        signalCaptureEvent();
        signalCaptureEvent();   // a second signal before the loop wakes is the same event
    });
    worker.join();
    serveMainLoopOnce();
    serveMainLoopOnce();
    EXPECT_EQ(captureEvents, 1);
    signalCaptureEvent();
    serveMainLoopOnce();
    EXPECT_EQ(captureEvents, 2);
}

TEST_F(MainLoop, CallsPostedFromAWorkerRunOnTheLoopThread) {
    std::thread::id loopThread = std::this_thread::get_id(), ranOn;
    std::thread worker([&] {
        postToMainLoop([&] { ranOn = std::this_thread::get_id(); });
        postQuit(0);
    });
    volatile uint32_t quit = 0;
    runMainLoop(&quit);
    worker.join();
    EXPECT_EQ(ranOn, loopThread);
}

TEST_F(MainLoop, TimersFireWhenDueAndStopWhenStopped) {
    setManualClock(true);
    int ticks = 0;
    startTimer(3, 10, [&] { ticks++; });
    serveMainLoopOnce();
    EXPECT_EQ(ticks, 0) << "not due before 10 ms";
    advanceManualClock(10);
    serveMainLoopOnce();
    EXPECT_EQ(ticks, 1);
    advanceManualClock(10);
    serveMainLoopOnce();
    EXPECT_EQ(ticks, 2);
    stopTimer(3);
    advanceManualClock(50);
    serveMainLoopOnce();
    EXPECT_EQ(ticks, 2);
}

TEST(Clock, TheTimeCounterCountsHundredths) {
    setManualClock(true);
    advanceManualClock(10 - clockMilliseconds() % 10);   // start on a whole hundredth
    uint32_t start = timeCounter();
    advanceManualClock(1234);
    EXPECT_EQ(timeCounter() - start, 123u) << "12.34 s is 123 whole hundredths";
    advanceManualClock(6);
    EXPECT_EQ(timeCounter() - start, 124u);
    setManualClock(false);
}

TEST(Worker, AResumeBeforeTheSuspendIsNotLost) {
    SuspendableWorker worker;
    std::atomic<int> rounds{0};
    std::atomic<bool> resumed{false};
    startWorker(worker, [&] {
        while (!resumed) std::this_thread::yield();
        suspendWorker(worker);   // must return at once: the resume came first
        rounds++;
    });
    resumeWorker(worker);
    resumed = true;
    joinWorker(worker);
    EXPECT_EQ(rounds, 1);
}

TEST(Worker, AStopRequestWakesASuspendedWorker) {
    SuspendableWorker worker;
    std::atomic<int> rounds{0};
    startWorker(worker, [&] {
        while (!workerStopRequested(worker)) {
            rounds++;
            suspendWorker(worker);
        }
    });
    while (rounds == 0) std::this_thread::yield();
    resumeWorker(worker);
    requestWorkerStop(worker);
    joinWorker(worker);
    EXPECT_GE(rounds, 1);
    EXPECT_FALSE(workerStopRequested(worker)) << "joining resets the worker for the next start";
}
