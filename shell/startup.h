#pragma once
// The program's entry sequence: start-up in its fixed order, the one message loop, and
// shut-down in its fixed order. The desktop program and the command-line tool both run it;
// the desktop program fills the hooks for the steps that need windows or audio devices.

#include <cstdint>
#include <string>

// Steps that belong to the desktop program or to an audio backend. A null hook is a step
// the running program does not have (the command-line tool has none of them).
struct StartupHooks {
    int (*startGraphics)();          // 1 when the drawing system started
    void (*stopGraphics)();
    int (*createMainFrame)();        // 1 when the main window, menus and toolbar exist
    void (*destroyMainFrame)();
    int (*createCaptureObject)();    // 1 when audio capture is available
    void (*releaseCaptureObject)();
    void (*showSplash)();            // starts the splash window; returns at once
    void (*updateMenus)();
};

struct StartupOptions {
    std::string sharedBasePath;      // overrides the configured shared base path when not empty
    StartupHooks hooks;              // all null for the headless program
    bool keepWorkingFiles = false;   // leave the song's working files in the shared folder at exit
};

// Process-wide state of the running program.
struct AppState {
    bool started;                    // start-up reached the loop (possibly with the quit flag set)
    bool settingsLoaded;             // every settings section was read; they are saved at shut-down
    bool directSoundAvailable;       // the capture object was created
    void* workAreas[2];              // the two small start-up work areas
    StartupHooks hooks;              // as passed to startUp
    bool keepWorkingFiles;           // as passed to startUp: shut-down leaves the working files
};
extern AppState appState;

// Disk space limits checked at start.
constexpr int64_t DISK_SPACE_MINIMUM = 1048576;    // below: refuse to start
constexpr int64_t DISK_SPACE_WARNING = 4194304;    // below: warn and start

// Result codes of the disk check.
enum DiskCheckResult { DISK_SPACE_ENOUGH = 0, DISK_SPACE_LOW = 1, DISK_SPACE_EXHAUSTED = 2 };
// Checks the free space on the shared folder's file system, showing the matching message.
int checkFreeDiskSpace();

// Brings the program up. 1: enter the loop (which runs only while the quit flag is 0);
// 0: start-up stopped early (its message has been shown) and nothing needs releasing.
int startUp(const StartupOptions& options);
// Runs the loop if the quit flag is still 0; returns the quit message's exit code, else 0.
int runMessageLoop();
// Takes everything down in order and returns exitCode.
int shutDown(int exitCode);
