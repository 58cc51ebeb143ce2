// The single-instance lock, free space, and the failure injection of the file wrappers and
// of allocations.
#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <vector>

#include "platform/allocation.h"
#include "platform/files.h"
#include "support/testSupport.h"

class InstanceLock : public ::testing::Test {
protected:
    void TearDown() override { releaseInstanceLock(); }
    TempFolder folder;
};

// Runs takeInstanceLock in a child process, as a second copy of the program would.
static int lockResultInChild(const std::string& path) {
    pid_t child = fork();
    if (child == 0) _exit(takeInstanceLock(path));
    int status = 0;
    waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

TEST_F(InstanceLock, ASecondCopyIsRefusedWhileTheFirstHoldsTheLock) {
    std::string path = folder.file("!InUse");
    ASSERT_EQ(takeInstanceLock(path), INSTANCE_LOCK_TAKEN);
    EXPECT_EQ(lockResultInChild(path), INSTANCE_LOCK_HELD);
    EXPECT_TRUE(fileExists(path)) << "the refused copy must leave the first copy's lock file in place";
}

TEST_F(InstanceLock, AStaleFileLeftByACrashIsTakenOver) {
    std::string path = folder.file("!InUse");
    writeFileText(path, "");
    EXPECT_EQ(takeInstanceLock(path), INSTANCE_LOCK_TAKEN);
    EXPECT_TRUE(instanceLockHeld());
}

TEST_F(InstanceLock, ReleasingRemovesTheFileAndLetsTheNextCopyIn) {
    std::string path = folder.file("!InUse");
    ASSERT_EQ(takeInstanceLock(path), INSTANCE_LOCK_TAKEN);
    releaseInstanceLock();
    EXPECT_FALSE(fileExists(path));
    EXPECT_EQ(lockResultInChild(path), INSTANCE_LOCK_TAKEN);
}

TEST_F(InstanceLock, AMissingFolderIsAFailureNotAnotherCopy) {
    EXPECT_EQ(takeInstanceLock(folder.file("absent/!InUse")), INSTANCE_LOCK_FAILED);
    EXPECT_FALSE(instanceLockHeld());
}

TEST(FreeDiskSpace, ReportsTheSpaceOfARealFolderAndHonoursTheOverride) {
    TempFolder folder;
    setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
    EXPECT_GT(freeDiskSpace(folder.path()), 0);
    EXPECT_EQ(freeDiskSpace(folder.file("no/such/folder")), -1);
    setFreeDiskSpaceOverride(12345);
    EXPECT_EQ(freeDiskSpace(folder.path()), 12345);
    setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
    EXPECT_NE(freeDiskSpace(folder.path()), 12345);
}

TEST(FileFailureInjection, FailsExactlyTheNthCallOfTheChosenOperation) {
    TempFolder folder;
    std::string path = folder.file("data");
    writeFileText(path, "abc");
    failFileCall(FILE_OP_OPEN, 2);
    FILE* first = fileOpen(path, "rb");
    FILE* second = fileOpen(path, "rb");
    FILE* third = fileOpen(path, "rb");
    EXPECT_NE(first, nullptr);
    EXPECT_EQ(second, nullptr);
    EXPECT_NE(third, nullptr);
    failFileCall(FILE_OP_READ, 1);
    char byte = 0;
    EXPECT_EQ(fileRead(&byte, 1, first), 0u);
    EXPECT_EQ(fileRead(&byte, 1, first), 1u);
    EXPECT_EQ(byte, 'a');
    fileClose(first);
    fileClose(third);
    clearFileFailures();
}

TEST(Folders, MakeFolderCreatesMissingParents) {
    TempFolder folder;
    EXPECT_EQ(makeFolder(folder.file("a/b/c/")), 0);
    EXPECT_TRUE(folderExists(folder.file("a/b/c")));
    EXPECT_EQ(makeFolder(folder.file("a/b/c")), 0) << "an existing folder is success";
    writeFileText(folder.file("plain"), "x");
    EXPECT_NE(makeFolder(folder.file("plain/sub")), 0);
}

TEST(AllocationFailureInjection, FailsExactlyTheNthAllocationAndLeavesTheVectorAsItWas) {
    std::vector<int> v{1, 2};
    failAllocation(2);
    EXPECT_TRUE(tryResize(v, 3));
    errno = 0;
    EXPECT_FALSE(tryResize(v, 10, 7));
    EXPECT_EQ(errno, ENOMEM);
    EXPECT_EQ(v, (std::vector<int>{1, 2, 0}));
    EXPECT_TRUE(allocationAllowed());
    // Beyond what a vector can hold is a failure too, not an exception.
    EXPECT_FALSE(tryResize(v, v.max_size() + 1));
    EXPECT_FALSE(tryAllocate([] { throw std::bad_alloc(); }));
    EXPECT_EQ(v.size(), 3u);
}
