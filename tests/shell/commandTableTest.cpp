// The command table as the menus show it: every item's text and key exactly as the program
// names them, the menu bar holding each command once, and accelerator table 130.
#include <gtest/gtest.h>

#include <map>
#include <set>
#include <string>
#include <tuple>

#include "shell/commandTable.h"

TEST(CommandTable, EveryMenuItemHasItsExactTextAndKey) {
    const std::map<int, std::string> texts = {
        {40017, "&Open...\tCtrl+O"},
        {40039, "&Close"},
        {42002, "&Save\tCtrl+S"},
        {40011, "Save &As..."},
        {42119, "Select Recor&ding Source..."},
        {42120, "&Record Audio...\tSpace"},
        {42088, "Pre&ferences..."},
        {40012, "E&xit\tAlt+F4"},
        {57643, "&Undo\tCtrl+Z"},
        {57644, "&Redo\tCtrl+Y"},
        {57635, "Cu&t\tCtrl+X"},
        {57634, "&Copy\tCtrl+C"},
        {57637, "&Paste\tCtrl+V"},
        {42012, "&Delete\tDelete"},
        {42013, "Select &All\tCtrl+A"},
        {42014, "D&eselect All\tEsc"},
        {42111, "&Chromatic"},
        {42110, "&Diatonic"},
        {42083, "Zoom to &50%"},
        {42084, "Zoom to &100%"},
        {42085, "Zoom to &200%"},
        {42075, "Zoom &In\tCtrl+NUM+"},
        {42074, "Zoom &Out\tCtrl+NUM-"},
        {42116, "&Split Note\tCtrl+L"},
        {42134, "&Join Notes\tCtrl+J"},
        {42164, "&Quantize\tCtrl+Q"},
        {42165, "&Flatten\tCtrl+F"},
        {42167, "Slide &up"},
        {42168, "Slide &down"},
        {42166, "Add &vibrato\tCtrl+B"},
        {42181, "Speed &up (10%)"},
        {42182, "Slow &down (10%)"},
        {42183, "D&ouble speed"},
        {42184, "&Halve speed"},
        {42185, "O&riginal speed"},
        {42186, "&Accelerando"},
        {42187, "D&ecelerando"},
        {42190, "&Ritenuto (hold back)\tCtrl+R"},
        {42139, "&Increase (3dB Boost)"},
        {42140, "&Decrease (3dB Cut)"},
        {42141, "D&ouble (10dB Boost)"},
        {42142, "&Halve (10dB Cut)"},
        {42135, "Set to &25%"},
        {42136, "Set to &50%"},
        {42137, "Set to &75%"},
        {42138, "Set to &100%"},
        {42122, "Strip &Ends of Song\tCtrl+E"},
        {42028, "&Play/Stop\tP"},
        {42103, "&Note"},
        {42106, "&Detail"},
        {42095, "&MIDI"},
        {42096, "&Wave"},
        {40028, "&Cascade"},
        {40004, "Tile &Horizontally"},
        {40005, "Tile &Vertically"},
        {40006, "Close &All"},
        {42005, "Torvellan Melodrift &Help...\tF1"},
        {42064, "R&ecording Tips..."},
        {40002, "&About Torvellan Melodrift..."},
    };
    EXPECT_EQ(commandTableCount, int(texts.size()));
    for (const auto& [id, text] : texts) {
        const CommandEntry* entry = findCommand(id);
        ASSERT_NE(entry, nullptr) << id;
        EXPECT_EQ(std::string(entry->menuText), text) << id;
    }
}

TEST(CommandTable, TheEditItemsCarryTheSongViewsCodes) {
    const std::map<int, int> codes = {{57643, 602}, {57644, 601}, {57635, 600}, {57634, 579},
                                      {57637, 598}, {42012, 127}, {42013, 577}, {42014, 27}};
    for (const auto& [id, code] : codes) EXPECT_EQ(findCommand(id)->songViewCode, code) << id;
    EXPECT_EQ(findCommand(CMD_QUANTIZE)->songViewCode, 0);
}

TEST(CommandTable, LabelAndKeyAreSplitAtTheTab) {
    const std::tuple<int, const char*, const char*> cases[] = {
        {CMD_OPEN, "&Open...", "Ctrl+O"}, {CMD_ZOOM_IN, "Zoom &In", "Ctrl+NUM+"}, {CMD_CLOSE, "&Close", ""}};
    for (auto [id, label, key] : cases) EXPECT_EQ(std::pair(commandLabel(id), commandKeyText(id)), std::pair(std::string(label), std::string(key)));
    EXPECT_EQ(commandLabel(CMD_SCANNING_CTRL_P), "");
}

TEST(CommandTable, CommandNamesDropTheMnemonicTheDotsAndTheKey) {
    EXPECT_EQ(commandName(CMD_RECORD), "Record Audio");
    EXPECT_EQ(commandName(CMD_SAVE_AS), "Save As");
    EXPECT_EQ(commandName(CMD_RITENUTO), "Ritenuto (hold back)");
    EXPECT_EQ(commandName(CMD_VOLUME_25), "Set to 25%");
}

TEST(CommandTable, TheMenuBarHoldsEveryCommandOnceInBalancedPopups) {
    std::multiset<int> seen;
    std::map<int, int> parentOf;   // popup -> enclosing popup
    std::vector<int> stack;
    for (int i = 0; i < menuBarCount; i++) {
        const MenuItem& item = menuBar[i];
        if (item.kind == MENU_POPUP) {
            parentOf[item.id] = stack.empty() ? 0 : stack.back();
            stack.push_back(item.id);
        } else if (item.kind == MENU_END) {
            ASSERT_FALSE(stack.empty()) << i;
            stack.pop_back();
        } else if (item.kind == MENU_COMMAND) {
            ASSERT_FALSE(stack.empty()) << i;
            seen.insert(item.id);
        }
    }
    EXPECT_TRUE(stack.empty());
    for (int i = 0; i < commandTableCount; i++) EXPECT_EQ(seen.count(commandTable[i].id), 1u) << commandTable[i].id;
    EXPECT_EQ(int(seen.size()), commandTableCount);
    EXPECT_EQ(std::tuple(parentOf[POPUP_PITCH], parentOf[POPUP_TIMING], parentOf[POPUP_VOLUME], parentOf[POPUP_MODE]),
              std::tuple(POPUP_NOTES, POPUP_NOTES, POPUP_NOTES, POPUP_PLAY));
}

TEST(CommandTable, AcceleratorTable130SendsTheseCommands) {
    struct Row {
        int key, modifiers, command;
    };
    const Row expected[] = {
        {0x73, ACCEL_ALT, 40012},    {'O', ACCEL_CONTROL, 40017}, {'P', ACCEL_CONTROL, 57607},
        {0x20, 0, 42120},            {'S', ACCEL_CONTROL, 42002}, {'G', ACCEL_CONTROL, 42069},
        {'D', ACCEL_CONTROL, 42068}, {0x70, 0, 42005},            {'J', ACCEL_CONTROL, 42134},
        {'B', ACCEL_CONTROL, 42166}, {'F', ACCEL_CONTROL, 42165}, {'Q', ACCEL_CONTROL, 42164},
        {'E', ACCEL_CONTROL, 42122}, {'L', ACCEL_CONTROL, 42116}, {'T', ACCEL_SHIFT, 42072},
        {'H', ACCEL_CONTROL, 42061}, {'N', ACCEL_CONTROL, 40082}, {0x6B, ACCEL_CONTROL, 42075},
        {0x6D, ACCEL_CONTROL, 42074}, {'R', ACCEL_CONTROL, 42190},
    };
    ASSERT_EQ(acceleratorTableCount, int(std::size(expected)));
    for (int i = 0; i < acceleratorTableCount; i++) {
        EXPECT_EQ(acceleratorTable[i].virtualKey, expected[i].key) << i;
        EXPECT_EQ(acceleratorTable[i].modifiers, expected[i].modifiers) << i;
        EXPECT_EQ(acceleratorTable[i].command, expected[i].command) << i;
    }
}
