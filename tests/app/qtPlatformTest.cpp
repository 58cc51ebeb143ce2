// The Qt backends of the platform layer: boxes titled as the program titles them with the
// icon of their kind, Yes/No answers, the status text, the progress window, and the main
// loop's posted calls, quit code, capture event and timers on Qt's event loop.
#include <QClipboard>
#include <QGuiApplication>
#include <QLabel>
#include <QMimeData>
#include <QProgressDialog>
#include <QThread>
#include <QtTest>
#include <thread>
#include <vector>

#include "appTestSupport.h"
#include "platform/qt/qtMainLoop.h"
#include "platform/qt/qtUi.h"

namespace {
int captureEventsServed = 0;
void countCaptureEvent() { captureEventsServed++; }
}  // namespace

class QtPlatformTest : public QObject {
    Q_OBJECT
private slots:
    void init() { resetEngineState(); }
    void cleanup() {
        setUiBackend(nullptr);
        setMainLoopBackend(nullptr);
        setCaptureEventHandler(nullptr);
        resetEngineState();
    }

    void boxesCarryTheProgramsTitleAndTheIconOfTheirKind() {
        QWidget owner;
        owner.show();
        installQtUi();
        setQtUiWindow(&owner, nullptr);
        SeenBox error;
        answerNextBox(&error, QMessageBox::Ok);
        showMessage(MESSAGE_ERROR, "Could not open FT file - openFTFile (2)");
        QVERIFY(error.seen);
        QCOMPARE(error.title, QString("Message from Torvellan Melodrift"));
        QCOMPARE(error.text, QString("Could not open FT file - openFTFile (2)"));
        QCOMPARE(error.icon, QMessageBox::Critical);

        SeenBox information;
        answerNextBox(&information, QMessageBox::Ok);
        showMessage(MESSAGE_INFORMATION, "Sorry - this cannot be done whilst opening audio.");
        QCOMPARE(information.icon, QMessageBox::Information);

        SeenBox question;
        answerNextBox(&question, QMessageBox::No);
        QCOMPARE(askYesNo("Would you like to load the backup file?"), 0);
        QCOMPARE(question.icon, QMessageBox::Question);
        answerNextBox(&question, QMessageBox::Yes);
        QCOMPARE(askYesNo("Would you like to load the backup file?"), 1);
        setQtUiWindow(nullptr, nullptr);
    }

    void aWorkersBoxIsShownOnTheInterfaceThread() {
        installQtUi();
        SeenBox box;
        answerNextBox(&box, QMessageBox::Yes);
        int answer = -1;
        std::thread worker([&answer] { answer = askYesNo("Load the rest of the file?"); });
        QTRY_VERIFY(box.seen);
        worker.join();
        QCOMPARE(answer, 1);
        QCOMPARE(box.text, QString("Load the rest of the file?"));
    }

    void aCopiedWaveReachesTheSystemClipboardAsAudioWav() {
        installQtUi();
        const std::vector<uint8_t> wave = {'R', 'I', 'F', 'F', 4, 0, 0, 0, 'W', 'A', 'V', 'E'};
        QCOMPARE(setClipboardWave(wave), 1);
        const QClipboard* clipboard = QGuiApplication::clipboard();
        QTRY_VERIFY(clipboard->mimeData() && clipboard->mimeData()->hasFormat("audio/wav"));
        QByteArray held = clipboard->mimeData()->data("audio/wav");
        QCOMPARE(held, QByteArray(reinterpret_cast<const char*>(wave.data()), qsizetype(wave.size())));
    }

    void statusTextGoesToTheSecondPartAndProgressToItsWindow() {
        QWidget owner;
        QLabel part2;
        owner.show();
        installQtUi();
        setQtUiWindow(&owner, &part2);
        setStatusText("Adjusting pitch...");
        QCOMPARE(part2.text(), QString("Adjusting pitch..."));
        std::thread worker([] { setStatusText("Generating MIDI..."); });
        worker.join();
        QTRY_COMPARE(part2.text(), QString("Generating MIDI..."));
        setStatusText("");
        QCOMPARE(part2.text(), QString());

        beginProgress("Adjusting volume", 100);
        auto* progress = owner.findChild<QProgressDialog*>("progressWindow");
        QVERIFY(progress);
        QCOMPARE(progress->labelText(), QString("Adjusting volume"));
        stepProgress(50);
        QCOMPARE(progress->value(), 50);
        endProgress();
        QTRY_VERIFY(!owner.findChild<QProgressDialog*>("progressWindow"));

        setWaitCursor(true);
        QVERIFY(QApplication::overrideCursor());
        QCOMPARE(QApplication::overrideCursor()->shape(), Qt::WaitCursor);
        setWaitCursor(true);
        setWaitCursor(false);
        QVERIFY(!QApplication::overrideCursor());
        setQtUiWindow(nullptr, nullptr);
    }

    void postedCallsRunInOrderAndQuitEndsTheLoopWithItsCode() {
        installQtMainLoop();
        std::vector<int> order;
        postToMainLoop([&order] { order.push_back(1); });
        std::thread worker([&order] { postToMainLoop([&order] { order.push_back(2); }); });
        worker.join();
        postQuit(7);
        postToMainLoop([&order] { order.push_back(3); });
        uint32_t flag = 0;
        QCOMPARE(runMainLoop(&flag), 7);
        QCOMPARE(flag, 1u);
        QCOMPARE(order, std::vector<int>({1, 2}));
        QCoreApplication::processEvents();
        QCOMPARE(order, std::vector<int>({1, 2}));
    }

    void signalsBeforeTheCaptureEventIsServedAreServedOnce() {
        installQtMainLoop();
        captureEventsServed = 0;
        setCaptureEventHandler(countCaptureEvent);
        std::thread worker([] {
            signalCaptureEvent();
            signalCaptureEvent();
        });
        worker.join();
        postQuit(0);
        uint32_t flag = 0;
        runMainLoop(&flag);
        QCOMPARE(captureEventsServed, 1);
        signalCaptureEvent();
        QTRY_COMPARE(captureEventsServed, 2);
    }

    void timersRunOnTheEventLoopUntilStopped() {
        installQtMainLoop();
        int ticks = 0;
        ::startTimer(42, 10, [&ticks] { ticks++; });
        QTRY_VERIFY(ticks >= 3);
        ::stopTimer(42);
        int stoppedAt = ticks;
        QTest::qWait(50);
        QCOMPARE(ticks, stoppedAt);
        ::startTimer(43, 10, [&ticks] { ticks++; });
        stopAllTimers();
        stoppedAt = ticks;
        QTest::qWait(50);
        QCOMPARE(ticks, stoppedAt);
    }
};

int runQtPlatformTests(int argc, char** argv) {
    QtPlatformTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "qtPlatformTest.moc"
