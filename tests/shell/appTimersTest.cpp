// The application timer registry: ids and their wrap-around, the 128-entry limit and its
// message, replacing equal entries, releasing, and which entries a due timer calls back.
#include <gtest/gtest.h>

#include <tuple>
#include <utility>
#include <vector>

#include "frameFixtures.h"

namespace {

std::vector<int> calls;   // ids passed to the callbacks, in order
void recordA(int id) { calls.push_back(id); }
void recordB(int id) { calls.push_back(1000000 + id); }

class AppTimersRegistry : public FrameTest {
protected:
    void SetUp() override {
        FrameTest::SetUp();
        calls.clear();
        setManualClock(true);
    }
    // Lets the main loop's clock pass ms and serves what came due.
    void pass(uint32_t ms) {
        advanceManualClock(ms);
        serveMainLoopOnce();
    }
    std::vector<int> ids() const {
        std::vector<int> result;
        for (int i = 0; i < appTimers.count; i++) result.push_back(appTimers.events[i].id);
        return result;
    }
};

}  // namespace

TEST_F(AppTimersRegistry, ClaimsTakeIdsFromOneUpwardsReleasesCloseTheGapAndAnEqualClaimReplaces) {
    ASSERT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 1, recordA), 1);
    ASSERT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordA), 1);
    ASSERT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 3, recordA), 1);
    EXPECT_EQ(ids(), std::vector<int>({1, 2, 3}));
    EXPECT_EQ(releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordA), 1);
    EXPECT_EQ(ids(), std::vector<int>({1, 3}));
    EXPECT_EQ(appTimers.events[1].key, 3);
    EXPECT_EQ(std::pair(releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordA),
                        releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 3, recordB)), std::pair(0, 0));
    // Claiming an equal entry replaces it with a new id.
    ASSERT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 1, recordA), 1);
    EXPECT_EQ(ids(), std::vector<int>({3, 4}));
    EXPECT_EQ(appTimers.events[1].key, 1);
}

TEST_F(AppTimersRegistry, The129thClaimIsRefusedWithTheMessage) {
    for (int key = 0; key < MAX_CLAIMED_EVENTS; key++)
        ASSERT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, key, recordA), 1) << key;
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 500, recordA), 0);
    EXPECT_EQ(std::tuple(lastMessageText(), uiCalls().back().kind, appTimers.count),
              std::tuple("Maximum number of claimed events has been reached!", MESSAGE_ERROR, MAX_CLAIMED_EVENTS));
    // An entry already held is replaced even in a full table.
    clearUiCalls();
    EXPECT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 5, recordA), 1);
    EXPECT_EQ(messageCount(), 0);
    EXPECT_EQ(appTimers.events[MAX_CLAIMED_EVENTS - 1].key, 5);
}

TEST_F(AppTimersRegistry, AfterId65536TheNextIdIs1) {
    appTimers.nextId = MAX_EVENT_ID;
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 1, recordA);
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordA);
    EXPECT_EQ(ids(), std::vector<int>({65536, 1}));
}

TEST_F(AppTimersRegistry, AWrappedIdStillHeldIsPassedOverSoTwoEntriesNeverShareATimer) {
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 1, recordA);   // id 1, kept
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordB);   // id 2, kept
    appTimers.nextId = MAX_EVENT_ID;
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 3, recordA);   // 65536
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 4, recordA);   // 1 and 2 are held: 3
    EXPECT_EQ(ids(), std::vector<int>({1, 2, 65536, 3}));
    // Releasing the newest leaves the first entry's timer running.
    releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 4, recordA);
    releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 3, recordA);
    releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordB);
    pass(10);
    EXPECT_EQ(calls, std::vector<int>({1}));
}

TEST_F(AppTimersRegistry, ADueTimerCallsEveryEntryOfItsWindowAndKeyWithItsId) {
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 5, recordA);        // id 1
    claimEvent(EVENT_WINDOW_TIMER, EVENT_WILDCARD, 5, recordB);          // id 2: any window
    claimEvent(EVENT_WINDOW_TIMER, 2, 5, recordA);                       // id 3: another window
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 6, recordA);        // id 4: another key
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, EVENT_WILDCARD, recordB);   // id 5: any key
    EXPECT_EQ(serveTimerEvents(SONG_VIEW_WINDOW, 5), 3);
    EXPECT_EQ(calls, std::vector<int>({1, 1000002, 1000005}));
}

TEST_F(AppTimersRegistry, AClaimedTimerFiresEvery10MsUntilReleased) {
    // Playback's way: its own window, the wildcard key.
    ASSERT_EQ(claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, EVENT_WILDCARD, recordA), 1);
    pass(9);
    EXPECT_TRUE(calls.empty());
    pass(1);
    pass(10);
    EXPECT_EQ(calls, std::vector<int>({1, 1}));
    releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, EVENT_WILDCARD, recordA);
    pass(10);
    pass(10);
    EXPECT_EQ(calls, std::vector<int>({1, 1}));
}

namespace {
void releaseOther(int) { releaseEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordB); }
}  // namespace

TEST_F(AppTimersRegistry, AnEntryReleasedByAnEarlierCallbackIsNotCalled) {
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, EVENT_WILDCARD, releaseOther);
    claimEvent(EVENT_WINDOW_TIMER, SONG_VIEW_WINDOW, 2, recordB);
    EXPECT_EQ(serveTimerEvents(SONG_VIEW_WINDOW, 2), 1);
    EXPECT_TRUE(calls.empty());
    EXPECT_EQ(appTimers.count, 1);
}
