// Start-up and shut-down as a whole: the lock, the disk-space checks, the clean-up of an
// earlier run's working files, the quit flag and the exit code.
#include <gtest/gtest.h>

#include <cstdlib>
#include <sys/wait.h>
#include <unistd.h>

#include "analysis/instrumentDefinitions.h"
#include "platform/files.h"
#include "platform/mainloop.h"
#include "platform/registry.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "shell/quitFlag.h"
#include "shell/startup.h"
#include "support/testSupport.h"

// Start-up resolves the paths anew; the fixture puts the run's back.
class StartUp : public ConfigFolderTest {
protected:
    void SetUp() override {
        ConfigFolderTest::SetUp();
        options.sharedBasePath = folder.path();
    }
    void TearDown() override {
        if (appState.started) shutDown(0);
        releaseInstanceLock();
        setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
        ConfigFolderTest::TearDown();
    }
    StartupOptions options{};
};

TEST_F(StartUp, RemovesWhatAnEarlierRunLeftInTheSharedFolder) {
    makeFolder(shared("CSUndo"));
    for (const char* name : {"CS.fw", "CS.fp", "CS.ft", "CS.fi", "CS.ft+", "CS.fi+", "_CS.fw", "_CS.ft", "_CS.fi",
                             "_CS.ft+", "_CS.fi+", "CSUndo/Undo3", "!Unsaved"})
        writeFileText(shared(name), "left over");
    writeFileText(shared("keep.txt"), "the user's own file");

    ASSERT_EQ(startUp(options), 1);
    for (const char* name : {"CS.fw", "CS.fp", "CS.ft", "CS.fi", "CS.ft+", "CS.fi+", "_CS.fw", "_CS.ft", "_CS.fi",
                             "_CS.ft+", "_CS.fi+", "CSUndo/Undo3", "!Unsaved"})
        EXPECT_FALSE(fileExists(shared(name))) << name;
    EXPECT_TRUE(fileExists(shared("keep.txt")));
    EXPECT_TRUE(fileExists(shared("!InUse")));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(StartUp, ASecondCopyIsRefusedAndLeavesTheFirstCopysLockInPlace) {
    makeFolder(shared(""));
    int toChild[2], fromChild[2];
    ASSERT_EQ(pipe(toChild), 0);
    ASSERT_EQ(pipe(fromChild), 0);
    pid_t first = fork();
    if (first == 0) {
        char ready = takeInstanceLock(shared("!InUse")) == INSTANCE_LOCK_TAKEN ? 'y' : 'n';
        (void)!write(fromChild[1], &ready, 1);
        char done;
        (void)!read(toChild[0], &done, 1);
        _exit(0);
    }
    char ready = 0;
    ASSERT_EQ(read(fromChild[0], &ready, 1), 1);
    ASSERT_EQ(ready, 'y');

    EXPECT_EQ(startUp(options), 0);
    EXPECT_EQ(lastMessageText(),
              "Sorry, it is not possible to run more than one copy of Notaglyph at a time. Notaglyph will now exit.");
    EXPECT_EQ(uiCalls().back().kind, MESSAGE_INFORMATION);
    EXPECT_TRUE(fileExists(shared("!InUse")));

    (void)!write(toChild[1], "x", 1);
    waitpid(first, nullptr, 0);
    for (int fd : {toChild[0], toChild[1], fromChild[0], fromChild[1]}) close(fd);
}

TEST_F(StartUp, AStaleLockFromACrashIsTakenOverAndRemovedAtShutDown) {
    makeFolder(shared(""));
    writeFileText(shared("!InUse"), "");
    ASSERT_EQ(startUp(options), 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(shutDown(0), 0);
    EXPECT_FALSE(fileExists(shared("!InUse")));
}

static const char* LOW_SPACE =
    "You have less than 4Mb of free disc space to store scanned pages and data. It is recommended that you have at "
    "least 32Mb to ensure save operation of this software. Please free some disc space.";
static const char* NO_SPACE =
    "There is less than 1Mb of free disc space to store scanned pages and data. Please free some disc space and try "
    "again. Notaglyph will now exit.";

// Below 1 MiB start-up is refused and the lock given back; below 4 MiB it warns once; from
// 4 MiB on, or with an unknown or huge figure, it starts silently.
TEST_F(StartUp, TheFreeSpaceDecidesWhetherStartUpWarnsOrStops) {
    struct Case {
        int64_t space;
        int started;
        const char* text;
    } cases[] = {{1048575, 0, NO_SPACE}, {1048576, 1, LOW_SPACE},  {4194303, 1, LOW_SPACE},
                 {4194304, 1, nullptr},  {-1, 1, nullptr},         {5000000000, 1, nullptr}};
    for (const Case& c : cases) {
        clearUiCalls();
        setFreeDiskSpaceOverride(c.space);
        EXPECT_EQ(startUp(options), c.started) << c.space;
        EXPECT_EQ(messageCount(), c.text ? 1 : 0) << c.space;
        if (c.text) { EXPECT_EQ(lastMessageText(), c.text); }
        EXPECT_EQ(instanceLockHeld(), c.started == 1);
        EXPECT_EQ(fileExists(shared("!InUse")), c.started == 1);
        if (c.started) shutDown(0);
    }
}

TEST_F(StartUp, TheLoopEndsWithTheQuitMessagesExitCode) {
    ASSERT_EQ(startUp(options), 1);
    bool served = false;
    postToMainLoop([&] {
        served = true;
        postQuit(3);
    });
    EXPECT_EQ(runMessageLoop(), 3);
    EXPECT_TRUE(served);
    EXPECT_EQ(shutDown(3), 3);
    EXPECT_FALSE(fileExists(shared("!InUse")));
}

TEST_F(StartUp, AFailureThatSetsTheQuitFlagSkipsTheLoopButStillShutsDown) {
    // A configuration "folder" that is a plain file cannot hold the settings.
    writeFileText(folder.file("config"), "not a folder");
    resetRegistry();
    ASSERT_EQ(startUp(options), 1);
    EXPECT_EQ(quitFlag, 1u);
    EXPECT_GE(messageCount(), 1);
    bool served = false;
    postToMainLoop([&] { served = true; });
    EXPECT_EQ(runMessageLoop(), 0);
    EXPECT_FALSE(served);
    EXPECT_EQ(shutDown(0), 0);
    EXPECT_FALSE(fileExists(shared("!InUse")));
}

TEST_F(StartUp, LoadsTheInstrumentDefinitionsAndFreesThemAtShutDown) {
    ASSERT_EQ(startUp(options), 1);
    ASSERT_FALSE(instrumentDefinitions.definitions.empty());
    EXPECT_EQ(instrumentDefinitions.definitions[0].name, "Voice");
    shutDown(0);
    EXPECT_TRUE(instrumentDefinitions.definitions.empty());
}
