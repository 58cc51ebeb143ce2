// The program's folders: resolving the shared base path and the resource path from both
// roots' "DataPath" keys, saving the user's shared folder, and finding the resources
// without any set-up.
#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <tuple>

#include "platform/registry.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "shell/quitFlag.h"
#include "shell/settings.h"
#include "support/testSupport.h"

namespace fs = std::filesystem;

class PathsTest : public ConfigFolderTest {
protected:
    void SetUp() override {
        ConfigFolderTest::SetUp();
        setInitialDirectory(start);
    }
    void writeRoot(const std::string& file, const std::string& dataPathValues) {
        fs::create_directories(config);
        writeFileText(file, "Melodrift Settings Version 1\n[SOFTWARE\\Torvellan\\Melodrift\\1.0\\DataPath]\n" +
                                dataPathValues);
    }
    static bool hasLine(const std::string& text, const std::string& line) {
        return ("\n" + text).find("\n" + line + "\n") != std::string::npos;
    }

    std::string start = folder.file("start/");   // the initial directory of these tests
};

// ---- resolving the paths ----

using PathsDataPath = PathsTest;

TEST_F(PathsDataPath, TheFirstStartWritesTheInitialDirectoryAsBothPaths) {
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(paths.resourcePath, start);
    EXPECT_EQ(paths.sharedBasePath, start);
    EXPECT_EQ(paths.sharedFolder, start + "Torvellan Shared/");
    std::string text = readFileText(machineFile());
    EXPECT_NE(text.find("\n[SOFTWARE\\Torvellan\\Melodrift\\1.0\\DataPath]\n"
                        "\"ResourcePath\"=\"" + start + "\"\n"
                        "\"TorvellanSharedPath\"=\"" + start + "\"\n"),
              std::string::npos);
    EXPECT_FALSE(fs::exists(userFile()));
    EXPECT_EQ(messageCount(), 0);
    // Started elsewhere, the existing key keeps its paths.
    setInitialDirectory(folder.file("elsewhere"));
    resetRegistry();
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(paths.initialDirectory, folder.file("elsewhere/"));
    EXPECT_EQ(paths.resourcePath, start);
    EXPECT_EQ(paths.sharedBasePath, start);
}

TEST_F(PathsDataPath, StoredPathsAreUsedWithATrailingSlashAndEmptyOrMissingOnesAreTheInitialDirectory) {
    writeRoot(machineFile(), "\"ResourcePath\"=\"/opt/melodrift\"\n\"TorvellanSharedPath\"=\"/var/data\"\n");
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(paths.resourcePath, "/opt/melodrift/");
    EXPECT_EQ(paths.sharedBasePath, "/var/data/");
    EXPECT_EQ(paths.sharedFolder, "/var/data/Torvellan Shared/");

    writeRoot(machineFile(), "\"ResourcePath\"=\"\"\n");
    resetRegistry();
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(paths.resourcePath, start);
    EXPECT_EQ(paths.sharedBasePath, start);
    std::string text = readFileText(machineFile());
    EXPECT_TRUE(hasLine(text, "\"ResourcePath\"=\"" + start + "\""));
    EXPECT_TRUE(hasLine(text, "\"TorvellanSharedPath\"=\"" + start + "\""));
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(PathsDataPath, APathThatCannotBeReadIsReportedAndTheInitialDirectoryStays) {
    writeRoot(machineFile(), "\"ResourcePath\"=dword:00000001\n\"TorvellanSharedPath\"=\"/var/data/\"\n");
    std::string before = readFileText(machineFile());
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(std::tuple(messageCount(), lastMessageText(), uiCalls().back().kind), std::tuple(1, "Can't read registry", MESSAGE_ERROR));
    EXPECT_EQ(std::tuple(paths.resourcePath, paths.sharedBasePath), std::tuple(start, "/var/data/"));
    EXPECT_EQ(readFileText(machineFile()), before);
}

TEST_F(PathsDataPath, TheUsersSharedPathLeavesTheMachinesValueUnreadAndUnwritten) {
    writeRoot(userFile(), "\"TorvellanSharedPath\"=\"/home/singer/shared/\"\n");
    // Were the machine's value read, its wrong type would be reported; were it rewritten,
    // the file would change.
    writeRoot(machineFile(), "\"ResourcePath\"=\"/opt/melodrift/\"\n\"TorvellanSharedPath\"=dword:00000000\n");
    std::string machineBefore = readFileText(machineFile());
    std::string userBefore = readFileText(userFile());
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(std::tuple(paths.sharedBasePath, paths.sharedFolder, paths.resourcePath),
              std::tuple("/home/singer/shared/", "/home/singer/shared/Torvellan Shared/", "/opt/melodrift/"));
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(readFileText(machineFile()), machineBefore);
    EXPECT_EQ(readFileText(userFile()), userBefore);
    // An empty user value counts as none.
    writeRoot(userFile(), "\"TorvellanSharedPath\"=\"\"\n");
    writeRoot(machineFile(), "\"ResourcePath\"=\"/opt/melodrift/\"\n\"TorvellanSharedPath\"=\"/var/data/\"\n");
    resetRegistry();
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(paths.sharedBasePath, "/var/data/");
}

TEST_F(PathsDataPath, AKeyThatCannotBeCreatedIsReportedAndStopsStartUp) {
    writeFileText(folder.file("config"), "in the way");
    EXPECT_EQ(loadDataPaths(), 0);
    EXPECT_EQ(std::tuple(lastMessageText(), messageCount(), quitFlag), std::tuple("Can't access registry properly", 1, 1u));
    EXPECT_EQ(std::tuple(paths.resourcePath, paths.sharedBasePath), std::tuple(start, start));
    // Saving the user's shared folder then fails too: reported, but no quitting.
    quitFlag = 0;
    EXPECT_EQ(saveSharedPath("/home/singer/takes"), 0);
    EXPECT_EQ(lastMessageText(), "Can't access registry properly");
    EXPECT_EQ(quitFlag, 0u);
}

// ---- the user's shared folder ----

using PathsSharedFolder = PathsTest;

TEST_F(PathsSharedFolder, ASharedPathWithoutATrailingSlashIsStoredWithOne) {
    ASSERT_EQ(saveSharedPath("/home/singer/takes"), 1);
    std::string text = readFileText(userFile());
    EXPECT_TRUE(hasLine(text, "\"TorvellanSharedPath\"=\"/home/singer/takes/\""));
    EXPECT_FALSE(fs::exists(machineFile()));

    ASSERT_EQ(saveSharedPath("/home/singer/other/"), 1);
    EXPECT_TRUE(hasLine(readFileText(userFile()), "\"TorvellanSharedPath\"=\"/home/singer/other/\""));

    resetRegistry();
    ASSERT_EQ(loadDataPaths(), 1);
    EXPECT_EQ(paths.sharedBasePath, "/home/singer/other/");
    EXPECT_EQ(sharedFilePath("CS.fw"), "/home/singer/other/Torvellan Shared/CS.fw");

    std::string before = readFileText(userFile());
    EXPECT_EQ(saveSharedPath(""), 0) << "an empty shared path is not stored";
    EXPECT_EQ(readFileText(userFile()), before);
    setSharedBasePath("/srv/music");
    EXPECT_EQ(paths.sharedBasePath, "/srv/music/");
    EXPECT_EQ(sharedFilePath("CSUndo/Undo3"), "/srv/music/Torvellan Shared/CSUndo/Undo3");
}

// ---- resources ----

using PathsResources = PathsTest;

TEST_F(PathsResources, TheConfiguredResourceFolderIsUsedWhenItHoldsResourcesElseTheSourceTrees) {
    std::string found = resourceFilePath("CSInst.dat");
    EXPECT_NE(found, start + "Resources/CSInst.dat");
    EXPECT_TRUE(fs::equivalent(fs::path(found).parent_path(), sourceRoot() + "Resources")) << found;
    fs::create_directories(start + "Resources");
    EXPECT_EQ(resourceFilePath("CSInst.dat"), start + "Resources/CSInst.dat");
}
