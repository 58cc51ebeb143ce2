// The headless user interface: what tests and the command-line tool rely on.
#include <gtest/gtest.h>

#include <tuple>

#include "platform/ui.h"

class HeadlessUi : public ::testing::Test {
protected:
    void SetUp() override { clearUiCalls(); }
    void TearDown() override { clearUiCalls(); }
};

TEST_F(HeadlessUi, MessagesCarryTheProgramTitleAndTheirKind) {
    showMessage(MESSAGE_ERROR, "File could not be closed");
    ASSERT_EQ(uiCalls().size(), 1u);
    EXPECT_EQ(uiCalls()[0].title, "Message from Torvellan Melodrift");
    EXPECT_EQ(uiCalls()[0].kind, MESSAGE_ERROR);
    EXPECT_EQ(uiCalls()[0].buttons, BUTTONS_OK);
    EXPECT_EQ(lastMessageText(), "File could not be closed");
}

TEST_F(HeadlessUi, QuestionsAreAnsweredFromThePresetThenYes) {
    presetAnswers({ANSWER_NO, ANSWER_YES});
    EXPECT_EQ((std::vector<int>{askYesNo("first?"), askYesNo("second?"),
                                messageBox("wioFileOpen", "third?", MESSAGE_WARNING, BUTTONS_YES_NO)}),
              (std::vector<int>{0, 1, ANSWER_YES}));
    EXPECT_EQ(std::tuple(messageCount(), uiCalls()[2].title, uiCalls()[0].value), std::tuple(3, "wioFileOpen", ANSWER_NO));
}

TEST_F(HeadlessUi, StatusCursorProgressAndBeepAreRecordedInOrder) {
    setWaitCursor(true);
    setStatusText("Deleting...");
    beginProgress("Quantize", 3);
    stepProgress(1);
    endProgress();
    setStatusText("");
    setWaitCursor(false);
    beep();
    std::vector<int> kinds;
    for (const UiCall& call : uiCalls()) kinds.push_back(call.call);
    EXPECT_EQ(kinds, (std::vector<int>{UI_WAIT_CURSOR, UI_STATUS_TEXT, UI_PROGRESS_BEGIN, UI_PROGRESS_STEP,
                                       UI_PROGRESS_END, UI_STATUS_TEXT, UI_WAIT_CURSOR, UI_BEEP}));
    EXPECT_EQ(uiCalls()[1].text, "Deleting...");
    EXPECT_EQ(uiCalls()[2].value, 3);
    EXPECT_EQ(lastMessageText(), "") << "no box was shown";
}

static std::string backendTitle;
static int backendBox(const std::string& title, const std::string&, int, int) {
    backendTitle = title;
    return ANSWER_NO;
}

TEST_F(HeadlessUi, AnInstalledBackendReceivesTheCallsInstead) {
    UiBackend backend{backendBox, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr};
    setUiBackend(&backend);
    EXPECT_EQ(askYesNo("Replace?"), 0);
    setUiBackend(nullptr);
    EXPECT_EQ(backendTitle, "Message from Torvellan Melodrift");
    EXPECT_EQ(messageCount(), 0) << "the headless record must not see calls meant for the backend";
}
