// Start-up and shut-down of the desktop program. The order is the engine's (shell/startup);
// this file supplies the steps that need Qt.
#include "app/desktopStartup.h"

#include <cstdio>
#include <cstdlib>
#include <string>
#include <vector>

#include <QApplication>
#include <QFileInfo>

#include "app/appStyle.h"
#include "app/mainFrame.h"
#include "app/splash.h"
#include "platform/mainloop.h"
#include "platform/capture.h"
#include "platform/media.h"
#include "platform/mixer.h"
#include "platform/pulse/pulseBackends.h"
#include "platform/qt/qtMainLoop.h"
#include "platform/qt/qtUi.h"
#include "platform/ui.h"
#include "shell/openQueue.h"

static int* qtArgc = nullptr;
static char** qtArgv = nullptr;
static QApplication* ownApplication = nullptr;   // created here, deleted here
static MainFrame* frame = nullptr;

// Qt cannot show a window without a display; without one it would abort the process, so
// the start is refused with the program's message instead.
static bool displayAvailable() {
    return !qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM") || !qEnvironmentVariableIsEmpty("DISPLAY") ||
           !qEnvironmentVariableIsEmpty("WAYLAND_DISPLAY");
}

static int startGraphics() {
    if (!qApp) {
        if (!displayAvailable()) return 0;
        ownApplication = new QApplication(*qtArgc, qtArgv);
    }
    QApplication::setApplicationName("Torvellan Melodrift");
    QApplication::setApplicationVersion(MELODRIFT_VERSION);
    // Leaving is the frame's decision (its close guard), not the last window's.
    QApplication::setQuitOnLastWindowClosed(false);
    applyAppStyle(*qApp);
    installQtUi();
    installQtMainLoop();
    // Without a sound server Play says so; nothing else needs it.
    installPulseMedia();
    return 1;
}

static void stopGraphics() {
    setMediaBackend(nullptr);
    setUiBackend(nullptr);
    stopQtTimers();
    setMainLoopBackend(nullptr);
    delete ownApplication;
    ownApplication = nullptr;
}

static int createMainFrame() {
    frame = new MainFrame;
    frame->showFrame();
    return 1;
}

static void destroyMainFrame() {
    delete frame;
    frame = nullptr;
}

static void updateMenus() {
    if (frame) frame->refreshFrame();
}

StartupHooks desktopStartupHooks(int* argc, char** argv) {
    qtArgc = argc;
    qtArgv = argv;
    StartupHooks hooks{};
    hooks.startGraphics = startGraphics;
    hooks.stopGraphics = stopGraphics;
    hooks.createMainFrame = createMainFrame;
    hooks.destroyMainFrame = destroyMainFrame;
    hooks.showSplash = showSplashScreen;
    // The input to record from: the sound server's default source, with its mixer.
    hooks.createCaptureObject = [] {
        installPulseCapture();
        installPulseMixer();
        return createCaptureObject();
    };
    hooks.releaseCaptureObject = [] {
        releaseCaptureObject();
        setCaptureBackend(nullptr);
        setMixerBackend(nullptr);
    };
    hooks.updateMenus = updateMenus;
    return hooks;
}

static void printUsage(FILE* out) {
    std::fprintf(out,
                 "Usage: melodrift [--shared DIR] [--config DIR] [FILE...]\n"
                 "\n"
                 "Opens the Torvellan Melodrift desktop program, and the wave files named.\n"
                 "\n"
                 "Options:\n"
                 "  --shared DIR   keep the working files in DIR/Torvellan Shared/ instead of the\n"
                 "                 configured shared folder\n"
                 "  --config DIR   read and write the settings in DIR instead of the user's\n"
                 "                 configuration folder (same as MELODRIFT_CONFIG_DIR)\n");
}

int runDesktopProgram(int argc, char** argv) {
    StartupOptions options{};
    std::vector<std::string> files;
    // Qt's own options (-platform, -style, ...) are left for the application object.
    static std::vector<char*> qtArguments;
    qtArguments.assign(argv, argv + 1);
    for (int i = 1; i < argc; i++) {
        std::string word = argv[i];
        if (word == "--help") {
            printUsage(stdout);
            return 0;
        }
        if (word == "--shared" || word == "--config") {
            if (i + 1 >= argc) {
                std::fprintf(stderr, "melodrift: %s needs a folder\n\n", word.c_str());
                printUsage(stderr);
                return 2;
            }
            if (word == "--shared") options.sharedBasePath = argv[++i];
            else setenv("MELODRIFT_CONFIG_DIR", argv[++i], 1);
        } else if (word.size() > 1 && word[0] == '-') {
            qtArguments.push_back(argv[i]);
            if (word == "-platform" || word == "-style" || word == "-display" || word == "-qwindowgeometry") {
                if (i + 1 < argc) qtArguments.push_back(argv[++i]);
            }
        } else {
            files.push_back(QFileInfo(QString::fromLocal8Bit(argv[i])).absoluteFilePath().toStdString());
        }
    }
    static int qtArgumentCount;
    qtArgumentCount = int(qtArguments.size());
    qtArguments.push_back(nullptr);

    // Until Qt's boxes are installed, messages go to the terminal.
    setUiEcho(true);
    options.hooks = desktopStartupHooks(&qtArgumentCount, qtArguments.data());
    if (!startUp(options)) return 0;
    if (!files.empty()) postToMainLoop([files] {
            queueFilesToOpen(files);
            workOffOpenQueue();
        });
    int exitCode = runMessageLoop();
    return shutDown(exitCode);
}
