// The desktop program's Qt tests: one application object for all of them, settings and
// working files in a temporary folder, and the suites run one after the other.
#include <QApplication>
#include <QDir>
#include <QTemporaryDir>
#include <cstdlib>

#include "app/appStyle.h"
#include "platform/files.h"
#include "platform/registry.h"
#include "platform/ui.h"
#include "shell/paths.h"

int runMainFrameTests(int argc, char** argv);
int runQtPlatformTests(int argc, char** argv);
int runDesktopStartupTests(int argc, char** argv);
int runSongViewTests(int argc, char** argv);
int runInstrumentWindowTests(int argc, char** argv);
int runPreferencesDialogTests(int argc, char** argv);

int main(int argc, char** argv) {
    if (qEnvironmentVariableIsEmpty("QT_QPA_PLATFORM")) qputenv("QT_QPA_PLATFORM", "offscreen");
    QApplication application(argc, argv);
    QApplication::setQuitOnLastWindowClosed(false);
    applyAppStyle(application);
    QTemporaryDir runFolder;
    if (!runFolder.isValid()) return 1;
    qputenv("MELODRIFT_CONFIG_DIR", QDir(runFolder.path()).filePath("config").toUtf8());
    resetRegistry();
    setInitialDirectory(runFolder.path().toStdString());
    setSharedBasePath(runFolder.path().toStdString());
    makeFolder(paths.sharedFolder);
    setUiEcho(false);

    int failures = 0;
    failures += runMainFrameTests(argc, argv) != 0;
    failures += runQtPlatformTests(argc, argv) != 0;
    failures += runDesktopStartupTests(argc, argv) != 0;
    failures += runSongViewTests(argc, argv) != 0;
    failures += runInstrumentWindowTests(argc, argv) != 0;
    failures += runPreferencesDialogTests(argc, argv) != 0;
    return failures;
}
