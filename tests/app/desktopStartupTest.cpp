// The desktop program's start-up and shut-down: the frame comes up maximized without a stored
// placement and with a stored normal one where it was left, the loop's quit code is the exit
// code, the modes come back, and a second copy on the same shared folder is refused with the
// program's message.
#include <QDir>
#include <QMdiArea>
#include <QToolButton>
#include <QTemporaryDir>
#include <QtTest>
#include <QProcess>
#include <cerrno>
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include "app/desktopStartup.h"
#include "app/mainFrame.h"
#include "appTestSupport.h"
#include "platform/files.h"
#include "platform/registry.h"
#include "shell/commandTable.h"
#include "shell/startup.h"

class DesktopStartupTest : public QObject {
    Q_OBJECT
private:
    QTemporaryDir folder;
    int argc = 1;
    char programName[10] = "melodrift";
    char* argv[2] = {programName, nullptr};

    StartupOptions options() {
        StartupOptions o{};
        o.sharedBasePath = folder.path().toStdString();
        o.hooks = desktopStartupHooks(&argc, argv);
        return o;
    }
    QString shared(const QString& name) const { return folder.path() + "/Torvellan Shared/" + name; }
    static bool lockIsHeld(const QString& path) {
        int fd = open(path.toLocal8Bit().constData(), O_RDONLY | O_CLOEXEC);
        if (fd < 0) return false;
        bool held = flock(fd, LOCK_EX | LOCK_NB) != 0 && errno == EWOULDBLOCK;
        close(fd);
        return held;
    }

private slots:
    void init() {
        resetEngineState();
        qputenv("MELODRIFT_CONFIG_DIR", QDir(folder.path()).filePath("config").toUtf8());
        resetRegistry();
    }
    void cleanup() {
        if (appState.started) shutDown(0);
        resetRegistry();
        resetEngineState();
    }

    void theFrameOpensMaximizedAndReopensWhereItWasLeft() {
        QVERIFY(folder.isValid());
        QCOMPARE(startUp(options()), 1);
        QVERIFY(mainFrame());
        QVERIFY(mainFrame()->isVisible());
        QVERIFY(mainFrame()->isMaximized());
        QCOMPARE(mainFrame()->windowTitle(), QString("Torvellan Melodrift"));
        QVERIFY(QFile::exists(shared("!InUse")));
        QTimer::singleShot(0, [] {
            mainFrame()->showNormal();
            mainFrame()->setGeometry(120, 90, 900, 640);
            mainFrame()->close();
        });
        int exitCode = runMessageLoop();
        QCOMPARE(exitCode, 0);
        QCOMPARE(shutDown(exitCode), 0);
        QVERIFY(!mainFrame());
        QVERIFY(!QFile::exists(shared("!InUse")));

        resetEngineState();
        resetRegistry();
        QCOMPARE(startUp(options()), 1);
        QVERIFY(!mainFrame()->isMaximized());
        QCOMPARE(mainFrame()->geometry(), QRect(120, 90, 900, 640));
        QTimer::singleShot(0, [] { postQuit(0); });
        shutDown(runMessageLoop());
    }

    void theModesOfTheLastRunComeBack() {
        QCOMPARE(startUp(options()), 1);
        mainFrame()->runCommand(CMD_MIDI_MODE);
        mainFrame()->runCommand(CMD_NOTE_MODE);
        QTimer::singleShot(0, [] { mainFrame()->close(); });
        shutDown(runMessageLoop());
        resetEngineState();
        resetRegistry();
        QCOMPARE(startUp(options()), 1);
        QCOMPARE(displayModes.playbackMode, PLAYBACK_MODE_MIDI);
        QCOMPARE(displayModes.noteMode, NOTE_MODE_NOTE);
        QCOMPARE(mainFrame()->toolbarButton(1)->text(), QString("MIDI"));
        QTimer::singleShot(0, [] { postQuit(5); });
        QCOMPARE(shutDown(runMessageLoop()), 5);   // the loop's quit code is the exit code
    }

    void aSecondCopyIsRefusedWithTheOneCopyMessage() {
        QDir().mkpath(shared(""));
        // The first copy is another process holding the lock as a running copy does (util-linux
        // flock takes the same kind of lock); a fork of this threaded process would be unsafe.
        QProcess first;
        first.start("flock", {"--nonblock", shared("!InUse"), "cat"});
        QVERIFY(first.waitForStarted());
        QTRY_VERIFY(lockIsHeld(shared("!InUse")));

        SeenBox box;
        answerNextBox(&box, QMessageBox::Ok);
        QCOMPARE(startUp(options()), 0);
        QVERIFY(box.seen);
        QCOMPARE(box.title, QString("Message from Torvellan Melodrift"));
        QCOMPARE(box.text, QString("Sorry, it is not possible to run more than one copy of Notaglyph at a time. "
                                   "Notaglyph will now exit."));
        QCOMPARE(box.icon, QMessageBox::Information);
        QVERIFY(!mainFrame());
        QVERIFY(QFile::exists(shared("!InUse")));

        first.closeWriteChannel();
        QVERIFY(first.waitForFinished());
    }
};

int runDesktopStartupTests(int argc, char** argv) {
    DesktopStartupTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "desktopStartupTest.moc"
