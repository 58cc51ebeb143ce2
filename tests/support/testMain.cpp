// The test runner: every suite runs with its settings and shared folder inside a temporary
// folder, so no test touches the user's own configuration or data.
#include <gtest/gtest.h>

#include <cstdlib>

#include "platform/ui.h"
#include "support/testSupport.h"

int main(int argc, char** argv) {
    ::testing::InitGoogleTest(&argc, argv);
    TempFolder runFolder;
    useTestFolders(runFolder);
    setUiEcho(false);
    return RUN_ALL_TESTS();
}
