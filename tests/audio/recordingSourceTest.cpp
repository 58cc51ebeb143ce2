// The recording page through the fake mixer: choosing the source and the microphone, the level
// slider, no mixer, failing mixer calls, cancelling; the quality list; the recording time; the
// quick preferences; confirming; and the level meter's caption.
#include <gtest/gtest.h>

#include <cstdlib>

#include "audio/recording.h"
#include "audio/recordingSource.h"
#include "platform/capture.h"
#include "platform/files.h"
#include "platform/mixer.h"
#include "platform/registry.h"
#include "platform/ui.h"
#include "shell/paths.h"
#include "shell/settings.h"
#include "store/song.h"
#include "support/testSupport.h"

namespace {

const int64_t MiB = 1048576;

class RecordingSource : public ::testing::Test {
protected:
    void SetUp() override {
        resetSettings();
        resetPreferences();
        resetRecordingState();
        clearUiCalls();
        fakeMixer = FakeMixer{};
        fakeMixer.sources = {{"Line In", false}, {"Front Microphone", true}, {"Rear Mic", true}};
        fakeMixer.levels = {20000, 30000, 40000};
        fakeMixer.on = {true, true, false};
        fakeMixer.selected = 0;
        installFakeMixer();
        setFreeDiskSpaceOverride(1024 * MiB);
    }
    void TearDown() override {
        resetPreferences();
        setMixerBackend(nullptr);
        preferencesDialog = nullptr;
        setFreeDiskSpaceOverride(NO_FREE_SPACE_OVERRIDE);
        resetSettings();
        song.blockCount = 0;
    }
    static void offerEveryQuality() {
        for (bool& available : recordingState.formatAvailable) available = true;
    }
};

}  // namespace

TEST_F(RecordingSource, TheMicrophoneButtonChoosesTheLastMicrophoneAtThreeQuartersOfItsRange) {
    ASSERT_EQ(beginPreferences(PAGE_SET_SOURCE), 1);
    const RecordingPage& p = recordingPage;
    EXPECT_EQ(p.groupTitle, "Source and level - Fake mixer");
    EXPECT_EQ(p.sources, (std::vector<std::string>{"Line In", "Front Microphone", "Rear Mic"}));
    EXPECT_EQ(p.selectedSource, 0);
    EXPECT_TRUE(p.sourcesEnabled);
    setUpMicrophone();
    EXPECT_EQ(fakeMixer.selected, 2);
    EXPECT_EQ(fakeMixer.levels[2], 49151);
    EXPECT_TRUE(fakeMixer.on[2]);   // switched on, as it was off
    EXPECT_EQ(p.selectedSource, 2);
}

TEST_F(RecordingSource, TheSliderHasTheLoudestAtItsTop) {
    fakeMixer.levels[0] = 0;
    beginPreferences(PAGE_SET_SOURCE);
    EXPECT_EQ(recordingPage.sliderPosition, 255);
    EXPECT_EQ(recordingPage.sliderMinimum, 0);
    setRecordingLevelFromSlider(0);
    EXPECT_EQ(fakeMixer.levels[0], 65535);
    EXPECT_EQ(recordingPage.sliderPosition, 0);
    setRecordingLevelFromSlider(128);
    EXPECT_EQ(fakeMixer.levels[0], 127 * 65535 / 255);
    setRecordingSource(1, -1, false);   // another source, its own level
    EXPECT_EQ(recordingPage.level, 30000);
    EXPECT_EQ(recordingPage.sliderPosition, 255 - 30000 * 255 / 65535);
}

TEST_F(RecordingSource, WithoutMixerOrSourcesTheListSaysSoAndIsGreyed) {
    for (bool noMixer : {true, false}) {
        SCOPED_TRACE(noMixer ? "no mixer" : "a mixer without sources");
        resetPreferences();
        if (noMixer) setMixerBackend(nullptr);
        else {
            fakeMixer.sources.clear();
            fakeMixer.selected = -1;
        }
        beginPreferences(PAGE_SET_SOURCE);
        EXPECT_EQ(recordingPage.sources, std::vector<std::string>{"No sources available"});
        EXPECT_FALSE(recordingPage.sourcesEnabled);
        EXPECT_EQ(meterLevelText(), "No sources available");
    }
}

TEST_F(RecordingSource, AFailingMixerLeavesThePageAsItWasAndCancellingPutsTheSourceBack) {
    beginPreferences(PAGE_SET_SOURCE);
    setRecordingSource(1, 12345, false);
    EXPECT_EQ(fakeMixer.selected, 1);
    fakeMixer.failing = true;
    setRecordingSource(2, 100, false);
    EXPECT_EQ(recordingPage.selectedSource, 1);
    EXPECT_EQ(recordingPage.level, 12345);
    EXPECT_EQ(messageCount(), 0);
    fakeMixer.failing = false;
    cancelPreferences();
    EXPECT_EQ(fakeMixer.selected, 0);
    EXPECT_EQ(fakeMixer.levels[0], 20000);
    EXPECT_FALSE(fakeMixer.isOpen);
    EXPECT_FALSE(preferencesState.shown);
}

TEST_F(RecordingSource, TheQualityListOffersWhatTheInputCanRecord) {
    struct Case {
        std::vector<int> available;
        int stored;
        std::vector<std::string> labels;
        int quality;   // after filling
        bool enabled;
    };
    const Case cases[] = {
        {{8, 9, 5}, 9, {"Low (22050Hz, 8-bit)", "Medium (22050Hz, 16-bit)", "High (44100Hz, 16-bit)"}, 9, true},
        {{9, 5}, 8, {"Medium (22050Hz, 16-bit)", "High (44100Hz, 16-bit)"}, 9, true},
        {{}, 5, {"No options available - is DirectX 8.1 installed?"}, 5, false},
    };
    for (const Case& c : cases) {
        for (bool& available : recordingState.formatAvailable) available = false;
        for (int i : c.available) recordingState.formatAvailable[i] = true;
        preferencesState.global.inputWaveQuality = c.stored;
        fillQualityList();
        EXPECT_EQ(recordingPage.qualityLabels, c.labels);
        EXPECT_EQ(preferencesState.global.inputWaveQuality, c.quality);
        EXPECT_EQ(recordingPage.qualityEnabled, c.enabled);
    }
}

TEST_F(RecordingSource, TheRecordingTimeFollowsTheFreeSpaceQualityAndOptions) {
    offerEveryQuality();
    GeneralSettings general;
    GlobalSettings global, boosted;
    boosted.boostSpeed = true;
    GeneralSettings enhanced;
    enhanced.enhancedPitchAccuracy = true;
    // 44,100 Hz 16-bit: 88,200 bytes a second of wave; 86 blocks a second of 512 samples, 100
    // bytes each; 300,000 of Hires blocks (210,000 with boost at the default pitch range, with
    // 43 blocks; half as much again with enhanced accuracy).
    EXPECT_EQ(recordingTimeText(1024 * MiB, 5, general, global), "Recording time: 0h 44m");
    EXPECT_EQ(recordingTimeText(1024 * MiB, 5, general, boosted), "Recording time: 0h 58m");
    EXPECT_EQ(recordingTimeText(1024 * MiB, 5, enhanced, global), "Recording time: 0h 32m");
    EXPECT_EQ(recordingTimeText(20 * MiB, 5, general, global), "Recording time: 0h 0m");
    EXPECT_EQ(recordingTimeText(int64_t(1) << 47, 5, general, global), "Recording time: >100h 0m");
    // A quality the input cannot give is worked out as 22,050 Hz 8-bit.
    recordingState.formatAvailable[5] = false;
    EXPECT_EQ(recordingTimeText(1024 * MiB, 5, general, global), recordingTimeText(1024 * MiB, 8, general, global));

    general.pitchRange = 0;
    GeneralSettings veryLow;
    veryLow.pitchRange = 2;
    EXPECT_LT(minimumLatency(general, global), minimumLatency(veryLow, global));
    std::string text = minimumLatencyText(general, global);
    EXPECT_EQ(text.rfind("Minimum latency for these settings: 0.", 0), 0u) << text;
    EXPECT_EQ(text.substr(text.size() - 5), " secs");
}

TEST_F(RecordingSource, AFolderOnADriveWithLittleSpaceIsAdvisedAgainstButKept) {
    beginPreferences(PAGE_SET_ALL);
    setFreeDiskSpaceOverride(200 * MiB);
    chooseSharedFolder("/somewhere/else");
    EXPECT_EQ(lastMessageText(), FOLDER_SPACE_LOW_TEXT);
    EXPECT_EQ(preferencesState.sharedFolder, "/somewhere/else");
    // The input offers nothing here, so the time is worked out for 22,050 Hz 8-bit: 180 MiB at
    // 22,050 + 8,600 + 300,000 bytes a second.
    EXPECT_EQ(recordingPage.recordingTime, "Recording time: 0h 9m");
}

TEST_F(RecordingSource, ConfirmingSavesThePagesAndSaysWhatWaitsForARestartOrTheNextSong) {
    // Settings of this test's own, so that the shared folder it saves reaches no other test.
    TempFolder folder;
    std::string savedConfig = std::getenv("MELODRIFT_CONFIG_DIR") ? std::getenv("MELODRIFT_CONFIG_DIR") : "";
    setenv("MELODRIFT_CONFIG_DIR", folder.file("config").c_str(), 1);
    resetRegistry();
    struct Case {
        bool folderChosen;
        bool songHoldsAudio;
        std::vector<std::string> messages;
    };
    const Case cases[] = {
        {false, false, {}},
        {true, false, {SHARED_FOLDER_RESTART_TEXT}},
        {false, true, {PREFERENCES_AFTER_CLOSE_TEXT}},
        {true, true, {SHARED_FOLDER_RESTART_TEXT, PREFERENCES_AFTER_CLOSE_TEXT}},
    };
    for (const Case& c : cases) {
        resetSettings();
        clearUiCalls();
        song.blockCount = c.songHoldsAudio ? 100 : 0;
        beginPreferences(PAGE_SET_ALL);
        preferencesState.general.pitchRange = 2;
        preferencesState.global.inputWaveQuality = 9;
        if (c.folderChosen) chooseSharedFolder(folder.path() + "elsewhere");
        confirmPreferences();
        std::vector<std::string> messages;
        for (const UiCall& call : uiCalls())
            if (call.call == UI_MESSAGE_BOX) messages.push_back(call.text);
        EXPECT_EQ(messages, c.messages);
        EXPECT_EQ(generalSettings.pitchRange, 2);
        EXPECT_EQ(globalSettings.inputWaveQuality, 9);
        EXPECT_FALSE(preferencesState.shown);
    }
    resetSettings();
    loadAudioGeneralSettings();
    EXPECT_EQ(generalSettings.pitchRange, 2);   // saved
    resetSettings();
    setenv("MELODRIFT_CONFIG_DIR", savedConfig.c_str(), 1);
    resetRegistry();
}

TEST_F(RecordingSource, QuickPreferencesComeOnlyWhenAskedForAndOnceAtATime) {
    static std::vector<int> shown;
    static int answer = 1;
    shown.clear();
    // The dialog stands for the desktop program's: it begins the pages and ends them.
    preferencesDialog = [](int pageSet) {
        shown.push_back(pageSet);
        beginPreferences(pageSet);
        EXPECT_EQ(showQuickPreferences(PAGE_SET_SOURCE), 0);   // a second request while it is up
        if (answer) confirmPreferences();
        else cancelPreferences();
        return answer;
    };
    EXPECT_EQ(showQuickPreferences(PAGE_SET_RECORDING), 0);   // confirmed
    answer = 0;
    EXPECT_EQ(showQuickPreferences(PAGE_SET_OPENING), 1);     // cancelled
    generalSettings.quickPrefs = false;
    EXPECT_EQ(showQuickPreferences(PAGE_SET_RECORDING), 0);   // not shown
    EXPECT_EQ(showQuickPreferences(PAGE_SET_SOURCE), 1);      // Select Recording Source is always shown
    EXPECT_EQ(shown, (std::vector<int>{PAGE_SET_RECORDING, PAGE_SET_OPENING, PAGE_SET_SOURCE}));
    beginPreferences(PAGE_SET_ALL);
    EXPECT_EQ(showQuickPreferences(PAGE_SET_SOURCE), 0);      // the dialog is up already
    EXPECT_EQ(shown.size(), 3u);
}

TEST_F(RecordingSource, TheMeterCaptionNamesTheSourceAndItsLevelAndSwitchesItOn) {
    fakeMixer.selected = 2;
    EXPECT_EQ(meterLevelText(), "Sound level on Rear Mic (at 61%)");
    EXPECT_TRUE(fakeMixer.on[2]);
    EXPECT_FALSE(fakeMixer.isOpen);   // opened for the caption only
}
