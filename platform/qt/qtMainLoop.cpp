// The main loop on Qt's event loop. Posted calls are queued invocations on the application
// object, so they run in posting order on the user interface thread. The quit message leaves
// the loop with its exit code at once, even with further calls waiting behind it. The
// capture event is auto-reset: signals before it is served are served once.
#include "platform/qt/qtMainLoop.h"

#include <atomic>
#include <map>

#include <QCoreApplication>
#include <QThread>
#include <QTimer>

#include "platform/mainloop.h"

static std::atomic<bool> captureEventPending{false};
static std::atomic<bool> quitting{false};   // the quit message has been served; the loop is ending
static std::map<int, QTimer*> timers;   // by id; touched on the user interface thread only

static bool onUiThread() { return QThread::currentThread() == QCoreApplication::instance()->thread(); }

// Qt serves every event posted before it started a round, even after exit() was asked for in
// that round, so calls behind the quit message are skipped here.
static void qtPost(std::function<void()> call) {
    QMetaObject::invokeMethod(
        QCoreApplication::instance(),
        [call = std::move(call)] {
            if (!quitting) call();
        },
        Qt::QueuedConnection);
}

static void qtPostQuit(int exitCode) {
    qtPost([exitCode] {
        quitting = true;
        QCoreApplication::exit(exitCode);
    });
}

static void serveCaptureEvent() {
    captureEventPending = false;
    if (void (*handler)() = captureEventHandler()) handler();
}

static void qtSignalCaptureEvent() {
    if (!captureEventPending.exchange(true)) qtPost(serveCaptureEvent);
}

static void startOnUi(int id, int intervalMs, std::function<void()> call) {
    QTimer*& timer = timers[id];
    if (!timer) timer = new QTimer(QCoreApplication::instance());
    QObject::disconnect(timer, &QTimer::timeout, nullptr, nullptr);
    QObject::connect(timer, &QTimer::timeout, timer, std::move(call));
    timer->start(intervalMs < 1 ? 1 : intervalMs);
}

static void stopOnUi(int id) {
    auto it = timers.find(id);
    if (it == timers.end()) return;
    it->second->stop();
    it->second->deleteLater();
    timers.erase(it);
}

static void qtStartTimer(int id, int intervalMs, std::function<void()> call) {
    if (onUiThread()) startOnUi(id, intervalMs, std::move(call));
    else qtPost([id, intervalMs, call] { startOnUi(id, intervalMs, call); });
}

static void qtStopTimer(int id) {
    if (onUiThread()) stopOnUi(id);
    else qtPost([id] { stopOnUi(id); });
}

static int qtRun(volatile uint32_t* quitFlag) {
    if (*quitFlag) return 0;
    quitting = false;
    int exitCode = QCoreApplication::exec();
    // What still waits behind the quit message is never served.
    QCoreApplication::removePostedEvents(QCoreApplication::instance(), QEvent::MetaCall);
    quitting = false;
    captureEventPending = false;
    *quitFlag = 1;
    return exitCode;
}

void stopQtTimers() {
    for (auto& [id, timer] : timers) delete timer;
    timers.clear();
}

static const MainLoopBackend qtMainLoopBackend = {qtPost,       qtPostQuit, qtSignalCaptureEvent, qtStartTimer,
                                                  qtStopTimer, qtRun,      stopQtTimers};

void installQtMainLoop() { setMainLoopBackend(&qtMainLoopBackend); }
