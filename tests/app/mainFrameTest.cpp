// The main frame as the user meets it: the menus' texts, keys and enabled states for an empty
// song and for a song with notes in each mode, the zoom limits, the close guards, the mode
// buttons and their tips, the accelerators, the song's window and the Save dialog's box.
#include <QCheckBox>
#include <QFileDialog>
#include <QLabel>
#include <QMdiArea>
#include <QMdiSubWindow>
#include <QMenu>
#include <QMenuBar>
#include <QTableWidget>
#include <QToolButton>
#include <QtTest>

#include "app/fileDialogs.h"
#include "app/mainFrame.h"
#include "app/songView.h"
#include "app/songWindow.h"
#include "appTestSupport.h"
#include "shell/commandTable.h"

namespace {
std::vector<int> noteCommandsRun;   // ids the stand-in note operation received
}

class MainFrameTest : public QObject {
    Q_OBJECT
private:
    MainFrame* frame = nullptr;

    // Opens every menu as the user would, so each enables its items.
    void showAllMenus() {
        for (int id = POPUP_FILE; id <= POPUP_HELP; id++) emit frame->popupMenu(id)->aboutToShow();
    }
    bool enabled(int id) { return frame->commandAction(id)->isEnabled(); }
    bool popupEnabled(int id) { return frame->popupMenu(id)->menuAction()->isEnabled(); }
    QStringList enabledItems(std::initializer_list<int> ids) {
        QStringList result;
        for (int id : ids)
            if (enabled(id)) result << QString::fromStdString(commandName(id));
        return result;
    }
    void activate() {
        frame->activateWindow();
        QVERIFY(QTest::qWaitForWindowActive(frame));
    }

private slots:
    void init() {
        resetEngineState();
        noteCommandsRun.clear();
        frame = new MainFrame;
        frame->showFrame();
        QVERIFY(QTest::qWaitForWindowExposed(frame));
    }
    void cleanup() {
        delete frame;
        frame = nullptr;
        resetEngineState();
    }

    void theMenuBarHasTheProgramsMenusInOrder() {
        QStringList titles;
        for (QAction* action : frame->menuBar()->actions()) titles << action->text();
        QCOMPARE(titles, QStringList({"&File", "&Edit", "&View", "&Notes", "&Play", "&Window", "&Help"}));
        QStringList notes;
        for (QAction* action : frame->popupMenu(POPUP_NOTES)->actions())
            if (!action->isSeparator()) notes << action->text();
        QCOMPARE(notes, QStringList({"&Split Note", "&Join Notes", "&Pitch", "&Timing", "&Volume", "Strip &Ends of Song"}));
    }

    void everyItemShowsItsTextAndKey() {
        for (int i = 0; i < commandTableCount; i++) {
            const CommandEntry& entry = commandTable[i];
            QAction* action = frame->commandAction(entry.id);
            QVERIFY2(action, entry.menuText);
            QString text = QString::fromUtf8(entry.menuText);
            QCOMPARE(action->text(), text.section('\t', 0, 0));
            QCOMPARE(action->shortcut().isEmpty(), !text.contains('\t'));
        }
        QCOMPARE(frame->commandAction(CMD_OPEN)->shortcut().toString(), QString("Ctrl+O"));
        QCOMPARE(frame->commandAction(CMD_RECORD)->shortcut().toString(), QString("Space"));
        QCOMPARE(frame->commandAction(CMD_EXIT)->shortcut().toString(), QString("Alt+F4"));
        QCOMPARE(frame->commandAction(CMD_DELETE)->shortcut().toString(), QString("Del"));
        QCOMPARE(frame->commandAction(CMD_DESELECT_ALL)->shortcut().toString(), QString("Esc"));
        QCOMPARE(frame->commandAction(CMD_PLAY_STOP)->shortcut().toString(), QString("P"));
        QCOMPARE(frame->commandAction(CMD_HELP)->shortcut().toString(), QString("F1"));
        QCOMPARE(frame->commandAction(CMD_ZOOM_IN)->shortcut(),
                 QKeySequence(QKeyCombination(Qt::ControlModifier | Qt::KeypadModifier, Qt::Key_Plus)));
        QCOMPARE(frame->commandAction(CMD_ZOOM_OUT)->shortcut(),
                 QKeySequence(QKeyCombination(Qt::ControlModifier | Qt::KeypadModifier, Qt::Key_Minus)));
        QCOMPARE(frame->commandAction(CMD_ZOOM_IN)->shortcut().toString(), QString("Ctrl+Num++"));
    }

    void anEmptyProgramGreysEverySongItem() {
        showAllMenus();
        for (int i = 0; i < commandTableCount; i++)
            QVERIFY2(enabled(commandTable[i].id) == !commandTable[i].songItem, commandTable[i].menuText);
        QVERIFY(!popupEnabled(POPUP_PITCH));
        QVERIFY(!popupEnabled(POPUP_TIMING));
        QVERIFY(!popupEnabled(POPUP_VOLUME));
        QVERIFY(popupEnabled(POPUP_NOTES));
    }

    void anEmptySongGreysEveryNoteEditAndTimingItem() {
        frame->showSongWindow();
        showAllMenus();
        QCOMPARE(enabledItems({CMD_UNDO, CMD_REDO, CMD_CUT, CMD_COPY, CMD_PASTE, CMD_DELETE, CMD_SELECT_ALL,
                               CMD_DESELECT_ALL, CMD_SPLIT_NOTE, CMD_JOIN_NOTES, CMD_QUANTIZE, CMD_FLATTEN,
                               CMD_SPEED_UP, CMD_RITENUTO, CMD_VOLUME_INCREASE, CMD_VOLUME_25, CMD_STRIP_ENDS}),
                 QStringList());
        QVERIFY(!popupEnabled(POPUP_PITCH));
        QVERIFY(!popupEnabled(POPUP_TIMING));
        QVERIFY(!popupEnabled(POPUP_VOLUME));
        QCOMPARE(enabledItems({CMD_CLOSE, CMD_SAVE, CMD_SAVE_AS, CMD_ZOOM_IN, CMD_PLAY_STOP, CMD_CASCADE}),
                 QStringList({"Close", "Save", "Save As", "Zoom In", "Play/Stop", "Cascade"}));
    }

    void aSongWithNotesFollowsItsModes_data() {
        QTest::addColumn<int>("playbackMode");
        QTest::addColumn<int>("noteMode");
        QTest::addColumn<QStringList>("enabledNoteItems");
        QTest::addColumn<QStringList>("checkedModes");
        const QStringList always = {"Split Note", "Quantize", "Increase (3dB Boost)", "Strip Ends of Song"};
        QTest::newRow("MIDI, Note") << PLAYBACK_MODE_MIDI << NOTE_MODE_NOTE
                                    << always + QStringList({"Set to 25%", "Set to 100%"})
                                    << QStringList({"Chromatic", "Note", "MIDI"});
        QTest::newRow("MIDI, Detail") << PLAYBACK_MODE_MIDI << NOTE_MODE_DETAIL
                                      << always + QStringList({"Flatten", "Add vibrato", "Slide up", "Set to 25%",
                                                               "Set to 100%"})
                                      << QStringList({"Chromatic", "Detail", "MIDI"});
        QTest::newRow("Wave, Note") << PLAYBACK_MODE_WAVE << NOTE_MODE_NOTE
                                    << always + QStringList({"Speed up (10%)", "Ritenuto (hold back)"})
                                    << QStringList({"Chromatic", "Note", "Wave"});
        QTest::newRow("Wave, Detail") << PLAYBACK_MODE_WAVE << NOTE_MODE_DETAIL
                                      << always + QStringList({"Flatten", "Add vibrato", "Slide up",
                                                               "Speed up (10%)", "Ritenuto (hold back)"})
                                      << QStringList({"Chromatic", "Detail", "Wave"});
    }

    void aSongWithNotesFollowsItsModes() {
        QFETCH(int, playbackMode);
        QFETCH(int, noteMode);
        QFETCH(QStringList, enabledNoteItems);
        QFETCH(QStringList, checkedModes);
        makeSong(512, 6);
        selectNote(2);
        frame->showSongWindow();
        frame->runCommand(playbackMode == PLAYBACK_MODE_MIDI ? CMD_MIDI_MODE : CMD_WAVE_MODE);
        frame->runCommand(noteMode == NOTE_MODE_NOTE ? CMD_NOTE_MODE : CMD_DETAIL_MODE);
        showAllMenus();
        emit frame->popupMenu(POPUP_PITCH)->aboutToShow();
        emit frame->popupMenu(POPUP_TIMING)->aboutToShow();
        emit frame->popupMenu(POPUP_VOLUME)->aboutToShow();
        emit frame->popupMenu(POPUP_MODE)->aboutToShow();

        QStringList noteItems = enabledItems({CMD_SPLIT_NOTE, CMD_JOIN_NOTES, CMD_QUANTIZE, CMD_FLATTEN,
                                              CMD_ADD_VIBRATO, CMD_SLIDE_UP, CMD_SPEED_UP, CMD_RITENUTO,
                                              CMD_VOLUME_INCREASE, CMD_VOLUME_25, CMD_VOLUME_100, CMD_STRIP_ENDS});
        noteItems.sort();
        enabledNoteItems.sort();
        QCOMPARE(noteItems, enabledNoteItems);
        QCOMPARE(popupEnabled(POPUP_TIMING), playbackMode == PLAYBACK_MODE_WAVE);
        QVERIFY(popupEnabled(POPUP_PITCH));
        QVERIFY(popupEnabled(POPUP_VOLUME));
        // The edit items with one note selected: no clipboard and no undo step in this song.
        QCOMPARE(enabledItems({CMD_UNDO, CMD_REDO, CMD_CUT, CMD_COPY, CMD_PASTE, CMD_DELETE, CMD_SELECT_ALL,
                               CMD_DESELECT_ALL}),
                 QStringList({"Cut", "Copy", "Delete", "Select All", "Deselect All"}));
        QStringList checked;
        for (int id : {CMD_CHROMATIC, CMD_DIATONIC, CMD_NOTE_MODE, CMD_DETAIL_MODE, CMD_MIDI_MODE, CMD_WAVE_MODE})
            if (frame->commandAction(id)->isChecked()) checked << QString::fromStdString(commandName(id));
        QCOMPARE(checked, checkedModes);
    }

    void aBusySongGreysItsEditItems() {
        makeSong(512, 6);
        selectNote(1);
        frame->showSongWindow();
        audioActivity.opening = true;
        showAllMenus();
        QCOMPARE(enabledItems({CMD_CUT, CMD_SPLIT_NOTE, CMD_STRIP_ENDS, CMD_SELECT_ALL}), QStringList({"Select All"}));
        QVERIFY(!popupEnabled(POPUP_PITCH));
        audioActivity.opening = false;
    }

    void theSongWindowShowsTheSongView() {
        makeSong(512, 3);
        selectNote(1);
        frame->showSongWindow();
        QMdiSubWindow* sub = frame->mdiArea()->activeSubWindow();
        QVERIFY(sub);
        QCOMPARE(sub->objectName(), QString("WaveviewM"));
        QCOMPARE(sub->windowTitle(), QString("Waveview display"));
        QVERIFY(frame->songWindow()->songView());
        QCOMPARE(frame->songWindow()->songView()->objectName(), QString("Waveview"));
        QCOMPARE(frame->statusPart(3)->text(), QString("3 notes  ·  4.0 s"));
        // A second request brings the same window forward.
        frame->showSongWindow();
        QCOMPARE(frame->mdiArea()->subWindowList().size(), 1);
    }

    void zoomStaysWithinItsLimits() {
        makeSong(512, 1);
        frame->showSongWindow();
        QCOMPARE(frame->statusPart(4)->text(), QString("Zoom 100%"));
        for (int i = 0; i < 8; i++) frame->commandAction(CMD_ZOOM_IN)->trigger();
        QCOMPARE(zoomState.zoomFactor, 30.375);
        zoomState.zoomFactor = 40.0 / 1.5;
        frame->commandAction(CMD_ZOOM_IN)->trigger();
        QCOMPARE(zoomState.zoomFactor, 40.0);
        QCOMPARE(frame->statusPart(4)->text(), QString("Zoom 1000%"));
        frame->commandAction(CMD_ZOOM_IN)->trigger();
        QCOMPARE(zoomState.zoomFactor, 40.0);
        frame->commandAction(CMD_ZOOM_50)->trigger();
        frame->commandAction(CMD_ZOOM_OUT)->trigger();
        QCOMPARE(zoomState.zoomFactor, 2.0);
        QCOMPARE(frame->statusPart(4)->text(), QString("Zoom 50%"));
        activate();
        QTest::keyClick(frame, Qt::Key_Plus, Qt::ControlModifier | Qt::KeypadModifier);
        QCOMPARE(zoomState.zoomFactor, 3.0);
        QTest::keyClick(frame, Qt::Key_Minus, Qt::ControlModifier | Qt::KeypadModifier);
        QCOMPARE(zoomState.zoomFactor, 2.0);
    }

    void theFrameDoesNotCloseWhileOpening() {
        audioActivity.opening = true;
        QVERIFY(!frame->close());
        QVERIFY(frame->isVisible());
        QCOMPARE(QString::fromStdString(lastMessageText()), QString("Sorry - this cannot be done whilst opening audio."));
        frame->commandAction(CMD_EXIT)->trigger();
        QVERIFY(frame->isVisible());
        QCOMPARE(messageCount(), 2);
        QVERIFY(!globalSettings.hasMainWindowPosition);

        audioActivity.opening = false;
        QVERIFY(frame->close());
        QVERIFY(globalSettings.hasMainWindowPosition);
        WindowPlacement p{};
        QCOMPARE(readMainWindowPlacement(&p), 1);
        QCOMPARE(p.showState, SHOW_MAXIMIZED);
        // Closing posts the quit message with code 0.
        uint32_t flag = 0;
        QCOMPARE(runMainLoop(&flag), 0);
        QCOMPARE(flag, 1u);
    }

    void theSongWindowDoesNotCloseWhileRecording() {
        makeSong(512, 2);
        frame->showSongWindow();
        audioActivity.recording = true;
        frame->commandAction(CMD_CLOSE)->trigger();
        QCOMPARE(frame->mdiArea()->subWindowList().size(), 1);
        QCOMPARE(QString::fromStdString(lastMessageText()), QString("Sorry - this cannot be done whilst recording audio."));
        audioActivity.recording = false;
        frame->commandAction(CMD_CLOSE)->trigger();
        QTRY_COMPARE(frame->mdiArea()->subWindowList().size(), 0);
        QVERIFY(!frameState.songWindowOpen);
        QCOMPARE(noteList.count, 0);
        QCOMPARE(song.blockCount, 0u);
        QCOMPARE(frame->statusPart(3)->text(), QString("No song"));
    }

    void theModeButtonsToggleAndShowTheirTips() {
        QToolButton* playback = frame->toolbarButton(1);
        QCOMPARE(playback->text(), QString("Wave"));
        playback->click();
        QCOMPARE(displayModes.playbackMode, PLAYBACK_MODE_MIDI);
        QCOMPARE(playback->text(), QString("MIDI"));
        QCOMPARE(frame->statusPart(1)->text(),
                 QString("Tip: Hold E to temporarily toggle between MIDI and Wave editing/playback"));
        frame->toolbarButton(2)->click();
        QCOMPARE(frame->toolbarButton(2)->text(), QString("Note"));
        QCOMPARE(frame->statusPart(1)->text(),
                 QString("Tip: Hold W to temporarily toggle between Note and Detail editing/playback"));
        frame->toolbarButton(3)->click();
        QCOMPARE(frame->toolbarButton(3)->text(), QString("Diatonic"));
        QCOMPARE(globalSettings.scaleMode, LAYOUT_DIATONIC);
        QCOMPARE(frame->statusPart(1)->text(),
                 QString("Tip: Hold Q to temporarily toggle between Diatonic and Chromatic layouts"));
        QCOMPARE(frame->toolbarButton(0)->menu()->actions().size(), 7);
    }

    void theAcceleratorsReachTheDispatchAndRepeatTheGuards() {
        commandOperations.runNoteCommand = [](int command) {
            noteCommandsRun.push_back(command);
            return 1;
        };
        makeSong(512, 4);
        frame->showSongWindow();
        activate();
        QTest::keyClick(frame, Qt::Key_Q, Qt::ControlModifier);   // nothing selected: greyed, nothing
        QVERIFY(noteCommandsRun.empty());
        selectNote(0);
        QTest::keyClick(frame, Qt::Key_Q, Qt::ControlModifier);
        QTest::keyClick(frame, Qt::Key_R, Qt::ControlModifier);
        QTest::keyClick(frame, Qt::Key_E, Qt::ControlModifier);
        QCOMPARE(noteCommandsRun, std::vector<int>({CMD_QUANTIZE, CMD_RITENUTO, CMD_STRIP_ENDS}));
        QTest::keyClick(frame, Qt::Key_Space);
        QCOMPARE(QString::fromStdString(lastMessageText()),
                 QString("Record Audio is not available in this version of Torvellan Melodrift."));
        QCOMPARE(frame->acceleratorActions().size(), acceleratorTableCount);
    }

    void theSaveDialogCarriesTheSelectedRangeBox() {
        makeSong(512, 1);
        frame->showSongWindow();
        QFileDialog* dialog = createSaveDialog(frame);
        auto* check = dialog->findChild<QCheckBox*>("onlySaveSelectedRange");
        QVERIFY(check);
        QCOMPARE(check->text(), QString("&Only save selected range"));
        QVERIFY(!check->isChecked());
        QCOMPARE(dialog->nameFilters(), QStringList({"Wave audio files (*.wav)"}));
        QCOMPARE(dialog->acceptMode(), QFileDialog::AcceptSave);
        check->setChecked(true);
        delete dialog;
        QVERIFY(frameState.onlySaveSelectedRange);

        frame->runCommand(CMD_MIDI_MODE);
        dialog = createSaveDialog(frame);
        QVERIFY(dialog->findChild<QCheckBox*>("onlySaveSelectedRange")->isChecked());
        QCOMPARE(dialog->nameFilters(), QStringList({"MIDI files (*.mid)"}));
        delete dialog;

        QFileDialog* open = createOpenDialog(frame);
        QCOMPARE(open->fileMode(), QFileDialog::ExistingFiles);
        QCOMPARE(open->nameFilters(), QStringList({"Wave audio files (*.wav)"}));
        delete open;
    }

    void commandsWithoutTheirOperationSaySoInsteadOfPretending() {
        makeSong(512, 2);
        frame->showSongWindow();
        frame->commandAction(CMD_PLAY_STOP)->trigger();
        QCOMPARE(QString::fromStdString(lastMessageText()),
                 QString("Play/Stop is not available in this version of Torvellan Melodrift."));
        displayModes.playbackMode = PLAYBACK_MODE_MIDI;
        frame->commandAction(CMD_SAVE)->trigger();
        QCOMPARE(QString::fromStdString(lastMessageText()),
                 QString("Saving MIDI files is not available in this version of Torvellan Melodrift."));
    }
};

int runMainFrameTests(int argc, char** argv) {
    MainFrameTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "mainFrameTest.moc"
