// Start-up, the main loop and shut-down. The order of both sequences matters: the paths come
// before the lock, the lock before anything is written to the shared folder, and shut-down
// releases in reverse so that a second copy can start only when this one is gone.
#include "shell/startup.h"

#include <cstdlib>
#include <filesystem>
#include <new>
#include <unistd.h>

#include "analysis/instrumentDefinitions.h"
#include "audio/recording.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/sync.h"
#include "platform/ui.h"
#include "playback/playback.h"
#include "shell/appTimers.h"
#include "shell/closeSong.h"
#include "shell/mainFrame.h"
#include "shell/openQueue.h"
#include "shell/paths.h"
#include "shell/quitFlag.h"
#include "shell/recordingView.h"
#include "shell/saveSong.h"
#include "shell/settings.h"
#include "store/fileRoutines.h"
#include "store/song.h"
#include "store/undo.h"
#include "store/workingFiles.h"

AppState appState;

static const size_t WORK_AREA_BYTES = 4096;   // the two small start-up work areas

static const char* ONE_COPY_MESSAGE =
    "Sorry, it is not possible to run more than one copy of Notaglyph at a time. Notaglyph will now exit.";
static const char* NO_MEMORY_MESSAGE =
    "There is insufficient memory available to load Notaglyph. Notaglyph will now exit.";
static const char* GRAPHICS_MESSAGE =
    "GDI+ cannot be started. Please ensure you are using at least Windows 98 or Windows 4.0 SP6, or try "
    "reinstalling. This program will now exit.";
static const char* DISK_EXHAUSTED_MESSAGE =
    "There is less than 1Mb of free disc space to store scanned pages and data. Please free some disc space and "
    "try again. Notaglyph will now exit.";
static const char* DISK_LOW_MESSAGE =
    "You have less than 4Mb of free disc space to store scanned pages and data. It is recommended that you have at "
    "least 32Mb to ensure save operation of this software. Please free some disc space.";

int checkFreeDiskSpace() {
    int64_t space = freeDiskSpace(paths.sharedFolder);
    if (space < 0 || space > int64_t(0xFFFFFFFF)) space = DISK_SPACE_UNKNOWN;
    if (space < DISK_SPACE_MINIMUM) {
        showMessage(MESSAGE_ERROR, DISK_EXHAUSTED_MESSAGE);
        return DISK_SPACE_EXHAUSTED;
    }
    if (space < DISK_SPACE_WARNING) {
        showMessage(MESSAGE_INFORMATION, DISK_LOW_MESSAGE);
        return DISK_SPACE_LOW;
    }
    return DISK_SPACE_ENOUGH;
}

static std::string currentDirectory() {
    std::error_code error;
    std::string dir = std::filesystem::current_path(error).string();
    return error ? std::string("./") : dir;
}

// Releases what start-up took before the lock when it stops early.
static void stopEarly() {
    if (appState.hooks.stopGraphics) appState.hooks.stopGraphics();
}

// The capture notification event, served by the main loop.
static void serveCaptureEvent() { handleCaptureNotification(); }

int startUp(const StartupOptions& options) {
    appState = AppState{};
    appState.hooks = options.hooks;
    appState.keepWorkingFiles = options.keepWorkingFiles;
    quitFlag = 0;

    if (appState.hooks.startGraphics && !appState.hooks.startGraphics()) {
        showMessage(MESSAGE_ERROR, GRAPHICS_MESSAGE);
        return 0;
    }

    setInitialDirectory(currentDirectory());
    // After the first failure the remaining loads are skipped: the settings store is broken
    // and one message about it is enough.
    if (!loadDataPaths()) quitFlag = 1;
    // The command line may name another shared base path, so that batch runs and tests
    // never touch the user's own folder.
    if (!options.sharedBasePath.empty()) setSharedBasePath(options.sharedBasePath);

    if (!quitFlag && !loadGeneralSettings()) quitFlag = 1;
    if (!quitFlag && !loadAudioGeneralSettings()) quitFlag = 1;

    makeFolder(paths.sharedFolder);

    int lock = takeInstanceLock(sharedFilePath("!InUse"));
    if (lock == INSTANCE_LOCK_HELD) {
        showMessage(MESSAGE_INFORMATION, ONE_COPY_MESSAGE);
        stopEarly();
        return 0;
    }
    if (lock == INSTANCE_LOCK_FAILED) {
        // Without the lock two copies could delete each other's working files.
        showMessage(MESSAGE_ERROR, "Cannot " + sharedFilePath("!InUse"));
        stopEarly();
        return 0;
    }

    if (!quitFlag && !loadGlobalSettings()) quitFlag = 1;
    if (!quitFlag && !loadAudioGlobalSettings()) quitFlag = 1;
    appState.settingsLoaded = !quitFlag;
    applyDisplayModeSettings();

    if (appState.hooks.createMainFrame && !appState.hooks.createMainFrame()) quitFlag = 1;

    for (void*& area : appState.workAreas) area = ::operator new(WORK_AREA_BYTES, std::nothrow);
    if (!appState.workAreas[0] || !appState.workAreas[1]) {
        showMessage(MESSAGE_ERROR, NO_MEMORY_MESSAGE);
        quitFlag = 1;
    }

    appState.directSoundAvailable = appState.hooks.createCaptureObject && appState.hooks.createCaptureObject();

    resetSong();
    resetSongNames();
    // A missing or refused definitions file leaves the table empty; recognition then works
    // with the default voice.
    loadInstrumentDefinitions();
    createNamedMutexes();
    clearUndo();
    // A recording the last run did not finish is a take the user has sung: it is kept.
    recoverUnfinishedRecording();
    deleteWorkingFiles();
    setCaptureEventHandler(serveCaptureEvent);
    recordingHooks.stateChanged = recordingStateChanged;

    if (generalSettings.splashScreen && appState.hooks.showSplash) appState.hooks.showSplash();

    if (checkFreeDiskSpace() == DISK_SPACE_EXHAUSTED) {
        // Nothing has been written that needs keeping: give the lock back and leave.
        releaseInstanceLock();
        closeNamedMutexes();
        for (void*& area : appState.workAreas) {
            ::operator delete(area);
            area = nullptr;
        }
        if (appState.hooks.destroyMainFrame) appState.hooks.destroyMainFrame();
        stopEarly();
        return 0;
    }

    deleteReportedFile(sharedFilePath("!Unsaved"));
    if (appState.hooks.updateMenus) appState.hooks.updateMenus();
    resetMainLoop();
    appState.started = true;
    return 1;
}

int runMessageLoop() {
    if (quitFlag) return 0;
    return runMainLoop(&quitFlag);
}

// Files the document code leaves in the shared folder's "PDF" folder.
static void deleteDocumentTemporaries() {
    std::error_code error;
    std::filesystem::path folder(sharedFilePath("PDF"));
    if (!std::filesystem::is_directory(folder, error)) return;
    for (const auto& entry : std::filesystem::directory_iterator(folder, error))
        if (entry.is_regular_file(error)) deleteReportedFile(entry.path().string());
}

int shutDown(int exitCode) {
    // Nothing sounds on after the program, and its playback files go with the song.
    stopPlayback();
    setCaptureEventHandler(nullptr);
    resetOpenQueue();
    resetAppTimers();
    stopAllTimers();

    deleteReportedFile(sharedFilePath("!Unsaved"));
    deleteDocumentTemporaries();

    // Settings that could not be read are not written back over whatever is there.
    if (appState.settingsLoaded) {
        saveGlobalSettings();
        saveAudioGlobalSettings();
    }

    for (void*& area : appState.workAreas) {
        ::operator delete(area);
        area = nullptr;
    }

    closeSong(appState.keepWorkingFiles);
    freeInstrumentDefinitions();
    undoState = UndoState{};
    closeNamedMutexes();

    if (appState.directSoundAvailable && appState.hooks.releaseCaptureObject) appState.hooks.releaseCaptureObject();
    appState.directSoundAvailable = false;

    if (appState.hooks.destroyMainFrame) appState.hooks.destroyMainFrame();
    resetMainLoop();
    if (appState.hooks.stopGraphics) appState.hooks.stopGraphics();

    releaseInstanceLock();
    appState.started = false;
    return exitCode;
}
