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
#include "shell/menuEnabling.h"

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
    // Every item, once its menu is opened, shows the enabled and checked state the enabling
    // rules give for the program's state now (the rules themselves are the engine's tests').
    void expectMenusFollowTheRules(const char* state) {
        showAllMenus();
        for (int id : {POPUP_PITCH, POPUP_TIMING, POPUP_VOLUME, POPUP_MODE}) emit frame->popupMenu(id)->aboutToShow();
        MenuState s = currentMenuState();
        for (int i = 0; i < commandTableCount; i++) {
            QAction* action = frame->commandAction(commandTable[i].id);
            QVERIFY2(action->isEnabled() == (commandEnabled(commandTable[i].id, s) == 1), state);
            if (action->isCheckable()) QVERIFY2(action->isChecked() == (commandChecked(commandTable[i].id, s) == 1), state);
        }
        for (int id : {POPUP_PITCH, POPUP_TIMING, POPUP_VOLUME}) QVERIFY2(popupEnabled(id) == (commandEnabled(id, s) == 1), state);
    }
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

    void theMenusFollowTheEnablingRulesInEveryState() {
        expectMenusFollowTheRules("no song");
        QVERIFY(!enabled(CMD_SAVE));
        QVERIFY(popupEnabled(POPUP_NOTES));
        frame->showSongWindow();
        expectMenusFollowTheRules("an empty song");
        QVERIFY(enabled(CMD_SAVE));
        QVERIFY(!popupEnabled(POPUP_PITCH));
        makeSong(512, 6);
        selectNote(2);
        for (int playback : {CMD_MIDI_MODE, CMD_WAVE_MODE}) {
            for (int note : {CMD_NOTE_MODE, CMD_DETAIL_MODE}) {
                frame->runCommand(playback);
                frame->runCommand(note);
                expectMenusFollowTheRules(commandName(playback).c_str());
                QCOMPARE(popupEnabled(POPUP_TIMING), playback == CMD_WAVE_MODE);
                QVERIFY(frame->commandAction(note)->isChecked());
            }
        }
        QVERIFY(enabled(CMD_SPLIT_NOTE));
        audioActivity.opening = true;
        expectMenusFollowTheRules("busy");
        QVERIFY(!enabled(CMD_SPLIT_NOTE));
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
        QCOMPARE(open->nameFilters(), QStringList({"Wave audio files (*.wav)", "MIDI files (*.mid *.midi)"}));
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
