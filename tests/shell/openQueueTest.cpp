// The open queue: files in the order chosen, one opening at a time, at most 400 from one
// choice, MIDI files to the MIDI reader, and a plain word when opening is not built.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "frameFixtures.h"

namespace {

std::vector<std::string> opened;   // paths handed to the stand-in operations, in order
bool openingStartsWorker = false;  // the stand-in leaves an opening running

class CommandTableOpenQueue : public FrameTest {
protected:
    void SetUp() override {
        FrameTest::SetUp();
        opened.clear();
        openingStartsWorker = false;
        setManualClock(true);
        commandOperations.openWaveFile = [](const std::string& path) {
            opened.push_back(path);
            if (openingStartsWorker) audioActivity.opening = true;
            return 1;
        };
        commandOperations.readMidiFile = [](const std::string& path) {
            opened.push_back("midi:" + path);
            return 1;
        };
    }
};

}  // namespace

TEST_F(CommandTableOpenQueue, FilesAreOpenedInTheOrderChosen) {
    EXPECT_EQ(queueFilesToOpen({"/songs/b.wav", "/songs/a.WAV", "/songs/c.mid"}), 3);
    workOffOpenQueue();
    EXPECT_EQ(opened, std::vector<std::string>({"/songs/b.wav", "/songs/a.WAV", "midi:/songs/c.mid"}));
    EXPECT_TRUE(openQueue.paths.empty());
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(CommandTableOpenQueue, TheNextFileWaitsUntilTheRunningOpeningHasFinished) {
    openingStartsWorker = true;
    queueFilesToOpen({"/songs/1.wav", "/songs/2.wav"});
    workOffOpenQueue();
    EXPECT_EQ(opened, std::vector<std::string>({"/songs/1.wav"}));
    advanceManualClock(OPEN_QUEUE_POLL_MS);
    serveMainLoopOnce();
    EXPECT_EQ(opened.size(), 1u);
    audioActivity.opening = false;
    advanceManualClock(OPEN_QUEUE_POLL_MS);
    serveMainLoopOnce();
    EXPECT_EQ(opened, std::vector<std::string>({"/songs/1.wav", "/songs/2.wav"}));
    // The queue is empty: its timer has stopped.
    EXPECT_FALSE(openQueue.waiting);
    advanceManualClock(OPEN_QUEUE_POLL_MS);
    EXPECT_EQ(serveMainLoopOnce(), 0);
}

TEST_F(CommandTableOpenQueue, AtMost400FilesAreQueuedFromOneChoice) {
    std::vector<std::string> chosen;
    for (int i = 0; i < 401; i++) chosen.push_back("/songs/" + std::to_string(i) + ".wav");
    EXPECT_EQ(queueFilesToOpen(chosen), 400);
    EXPECT_EQ(lastMessageText(), "Only the first 400 of the chosen files are opened.");
    workOffOpenQueue();
    ASSERT_EQ(opened.size(), 400u);
    EXPECT_EQ(opened.back(), "/songs/399.wav");
}

TEST_F(CommandTableOpenQueue, WithoutTheOpeningOperationOneMessageSaysSoAndTheQueueEmpties) {
    commandOperations.openWaveFile = nullptr;
    queueFilesToOpen({"/songs/1.wav", "/songs/2.wav"});
    workOffOpenQueue();
    EXPECT_EQ(messageCount(), 1);
    EXPECT_EQ(lastMessageText(), "Opening wave files is not available in this version of Torvellan Melodrift.");
    EXPECT_TRUE(openQueue.paths.empty());
    commandOperations.readMidiFile = nullptr;
    queueFilesToOpen({"/songs/tune.midi"});
    workOffOpenQueue();
    EXPECT_EQ(lastMessageText(), "Reading MIDI files is not available in this version of Torvellan Melodrift.");
}
