// The song view and the level meter on screen: a known song painted into an image with the
// note bars, grid lines, time selection, play cursor, pitch curve and info strip where the
// geometry puts them; scrolling of a short window; the zoom commands acting on the view; the
// meter's colours, narrow bars, hint, key forwarding and remembered size.
#include <QImage>
#include <QKeyEvent>
#include <QMdiArea>
#include <QScrollBar>
#include <QTemporaryDir>
#include <QTest>
#include <QToolButton>

#include "app/levelMeter.h"
#include "app/mainFrame.h"
#include "app/songView.h"
#include "app/songViewPainter.h"
#include "app/songWindow.h"
#include "analysis/pitchScale.h"
#include "appTestSupport.h"
#include "audio/openWaveFile.h"
#include "playback/meterGeometry.h"
#include "platform/media.h"
#include "platform/files.h"
#include "shell/paths.h"
#include "playback/playback.h"
#include "playback/playbackState.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "notes/selection.h"
#include "shell/commandTable.h"
#include "store/ftBlockStore.h"

static QColor pixel(const QImage& image, int x, int y) { return QColor(image.pixel(x, y)); }

// Receives the keys the meter passes on.
class KeyCatcher : public QWidget {
public:
    QList<int> keys;

protected:
    void keyPressEvent(QKeyEvent* event) override { keys << event->key(); }
};

class SongViewTest : public QObject {
    Q_OBJECT
private:
    // Plain fills, so that a pixel shows its element's own colour.
    void plainDrawing() {
        generalSettings.drawSmoothLines = false;
        generalSettings.drawTransparencies = false;
        generalSettings.drawGradients = false;
    }
    // The known song: 4 s, notes C4, C#4, D4 of 0.25 s from 0 s; a 1064 x 630 picture
    // (a plot of 600 pixels, 1000 right of the labels, 128 pixels per second).
    QImage paintKnownSong() {
        if (noteList.count == 0) makeSong(512, 3);
        QImage image(LABEL_COLUMN_WIDTH + 1000, 630, QImage::Format_RGB32);
        if (!paintSongView(image)) return QImage();
        return image;
    }
    static void setLevels(std::initializer_list<std::pair<int, int>> bars) {
        std::lock_guard<std::mutex> guard(levelMeter.lock);
        std::fill(std::begin(levelMeter.levels), std::end(levelMeter.levels), 0);
        for (auto [i, v] : bars) levelMeter.levels[i] = v;
    }

private slots:
    void init() {
        resetEngineState();
        resetSongViewGeometry();
        resetPointerInfo();
        resetPlaybackState();
        generalSettings = GeneralSettings{};
        setLevels({});
    }
    void cleanup() {
        stopPlayback();
        resetNullMedia();
        freeFTBlockWindow();
        resetEngineState();
        resetPlaybackState();
        resetPointerInfo();
        generalSettings = GeneralSettings{};
        setLevels({});
        setManualClock(false);
    }

    void noteBarsStandAtTheirSemitoneInNoteMode() {
        plainDrawing();
        displayModes.noteMode = NOTE_MODE_NOTE;
        makeSong(512, 3);
        selectNote(1);
        QImage image = paintKnownSong();
        QVERIFY(!image.isNull());
        const SongViewColours& c = songViewColours();
        QCOMPARE(pixel(image, timeToX(0.125), pitchToY(pitchToFrequency(60))), c.note);
        QCOMPARE(pixel(image, timeToX(0.375), pitchToY(pitchToFrequency(61))), c.selectedNote);
        // Nothing of the first note two semitones up, where the third note's pitch lies.
        QVERIFY(pixel(image, timeToX(0.125), pitchToY(pitchToFrequency(62))) != c.note);
        QCOMPARE(pixel(image, timeToX(0.625), pitchToY(pitchToFrequency(62))), c.note);
    }

    void gridLinesAndLabelsFollowTheLayout() {
        plainDrawing();
        QImage image = paintKnownSong();
        const SongViewColours& c = songViewColours();
        int x = timeToX(3.0);
        QCOMPARE(pixel(image, x, semitoneLineY(72)), c.octaveLine);   // C5
        QCOMPARE(pixel(image, x, semitoneLineY(67)), c.gridLine);     // G4
        QCOMPARE(pixel(image, x, semitoneLineY(67) + 3), c.plot);
        // The C4 label is written in the label column beside its line.
        int ink = 0;
        for (int px = 4; px < LABEL_COLUMN_WIDTH - 8; px++)
            for (int py = semitoneLineY(60) - 5; py <= semitoneLineY(60) + 5; py++)
                if (pixel(image, px, py) != c.labelColumn) ink++;
        QVERIFY(ink > 10);
        // Diatonic: the C# line is the C line, so no line lies half way to D.
        globalSettings.scaleMode = SCALE_MODE_DIATONIC;
        paintSongView(image);
        QCOMPARE(pixel(image, x, semitoneLineY(60)), c.octaveLine);
        QCOMPARE(pixel(image, x, (semitoneLineY(60) + semitoneLineY(62)) / 2), c.plot);
    }

    void theTimeSelectionCoversItsStretch() {
        plainDrawing();
        selection.timeSelectionStart = 1.0f;
        selection.timeSelectionEnd = 2.0f;
        QImage image = paintKnownSong();
        int y = semitoneLineY(67) + 3;
        QColor inside = pixel(image, timeToX(1.5), y);
        QCOMPARE(inside, songViewColours().timeSelectionOpaque);
        QCOMPARE(pixel(image, timeToX(1.0), y), songViewColours().timeSelection);   // its left edge
        QCOMPARE(pixel(image, timeToX(2.5), y), songViewColours().plot);
        QCOMPARE(pixel(image, timeToX(0.5), y), songViewColours().plot);
        // Translucent: the grid shows through a tinted fill.
        generalSettings.drawTransparencies = true;
        paintSongView(image);
        QColor tinted = pixel(image, timeToX(1.5), y);
        QVERIFY(tinted != songViewColours().plot);
        QVERIFY(tinted.blue() > tinted.red());
        QCOMPARE(pixel(image, timeToX(1.5), semitoneLineY(72)) == pixel(image, timeToX(1.5), y), false);
    }

    void thePlayCursorIsDrawnOnlyWhilePlaying() {
        plainDrawing();
        QImage image = paintKnownSong();
        int x = timeToX(2.0), y = 100;
        QVERIFY(pixel(image, x, y) != songViewColours().playCursor);
        playbackState.waveDevice = 1;
        playbackState.cursor = 200;
        playbackState.end = 400;
        paintSongView(image);
        QCOMPARE(pixel(image, x, y), songViewColours().playCursor);
        playbackState.cursor = 400;   // at the end: playback is over
        paintSongView(image);
        QVERIFY(pixel(image, timeToX(4.0) - 1, y) != songViewColours().playCursor);
    }

    void detailModeDrawsTheDetectedPitchOfEachBlock() {
        plainDrawing();
        makeSong(512, 3);
        ftBlockWindow.detectedFrequenciesBuffers.assign(512, FTDetectedBuffer{});
        ftBlockWindow.firstBlock = 0;
        ftBlockWindow.endBlock = 512;
        for (int b = 128; b < 256; b++) {
            ftBlockWindow.detectedFrequenciesBuffers[b].nEntries = 1;
            ftBlockWindow.detectedFrequenciesBuffers[b].entries[0].frequency = 440.0f;
        }
        QImage image(LABEL_COLUMN_WIDTH + 1000, 630, QImage::Format_RGB32);
        QVERIFY(paintSongView(image));
        const SongViewColours& c = songViewColours();
        QCOMPARE(pixel(image, timeToX(1.5), pitchToY(440.0)), c.pitchCurve);
        QVERIFY(pixel(image, timeToX(2.5), pitchToY(440.0)) != c.pitchCurve);   // no detection there
        QVERIFY(pixel(image, timeToX(0.125), pitchToY(pitchToFrequency(60))) != c.note);   // no bars in Detail
        if (!qEnvironmentVariableIsEmpty("MELODRIFT_SONG_VIEW_PNG")) image.save(qgetenv("MELODRIFT_SONG_VIEW_PNG"));
    }

    void theInfoStripShowsTheKindAndGreenTimes() {
        selection.timeSelectionStart = 1.0f;
        selection.timeSelectionEnd = 2.0f;
        makeSong(512, 3);
        QImage image(LABEL_COLUMN_WIDTH + 1000, 630, QImage::Format_RGB32);
        paintSongView(image);
        updatePointerInfo(timeToX(1.5), 300);
        QCOMPARE(QString::fromStdString(pointerInfo.kind), QString("SELECTION"));
        paintSongView(image);
        int green = 0, strip = 0;
        for (int x = INFO_TIME_X; x < INFO_PITCH_X; x++)
            for (int y = 630 - PLOT_BOTTOM_MARGIN + 2; y < 630; y++) {
                QColor p = pixel(image, x, y);
                if (p.green() > 200 && p.red() < 60) green++;
                if (p == songViewColours().strip) strip++;
            }
        QVERIFY(green > 40);
        QVERIFY(strip > 100);
        // The tuning indicator's centre mark.
        QCOMPARE(pixel(image, TUNING_CENTRE_X, 630 - PLOT_BOTTOM_MARGIN / 2), songViewColours().tuningCentre);
    }

    void aShortWindowScrollsVertically() {
        makeSong(512, 3);
        SongWindow window;
        window.resize(800, 300);
        window.show();
        QVERIFY(QTest::qWaitForWindowExposed(&window));
        SongView* view = window.songView();
        QCOMPARE(songViewGeometry.plotHeight, PLOT_MINIMUM_HEIGHT);
        QCOMPARE(view->verticalScrollBar()->maximum(), maxScrollY());
        QVERIFY(maxScrollY() > 0);
        view->verticalScrollBar()->setValue(50);
        QCOMPARE(songViewGeometry.scrollY, 50);
        QCOMPARE(window.toolbarButton(3)->text(), QString("Play"));
        QCOMPARE(window.toolbarButton(1)->text(), QString("Detail"));
    }

    // Clicks on the note bars select as the view's click rules say; the edit keys reach the view.
    void clicksAndEditKeysSelectNotes() {
        makeSong(512, 3);
        SongWindow window;
        window.resize(800, 600);
        window.show();
        QVERIFY(QTest::qWaitForWindowExposed(&window));
        SongView* view = window.songView();
        auto noteAt = [](int i) {
            const Note& n = noteList.notes[i];
            return QPoint(timeToX((n.waveStart + n.waveEnd) / 2), pitchToY(pitchToFrequency(n.midiNote)));
        };
        auto selected = [] {
            return std::vector<int>(selection.selectedNotes, selection.selectedNotes + selection.selectedNoteCount);
        };
        QTest::mouseClick(view->viewport(), Qt::LeftButton, Qt::NoModifier, noteAt(1));
        QCOMPARE(selected(), std::vector<int>({1}));
        QTest::mouseClick(view->viewport(), Qt::LeftButton, Qt::ControlModifier, noteAt(2));
        QCOMPARE(selected(), std::vector<int>({1, 2}));
        QTest::keyClick(view, Qt::Key_Escape);
        QCOMPARE(selected(), std::vector<int>());
        QTest::keyClick(view, Qt::Key_A, Qt::ControlModifier);
        QCOMPARE(selected(), std::vector<int>({0, 1, 2}));
        QTest::keyClick(view, Qt::Key_Escape);
        QTest::keyClick(view, Qt::Key_Tab);
        QTest::keyClick(view, Qt::Key_Tab);
        QCOMPARE(selected(), std::vector<int>({1}));
    }

    void theZoomCommandsActOnTheView() {
        makeSong(512, 3);
        MainFrame frame;
        frame.showFrame();
        QVERIFY(QTest::qWaitForWindowExposed(&frame));
        frame.showSongWindow();
        QApplication::processEvents();
        QCOMPARE(timeToX(1.0) - timeToX(0.0), 128);
        frame.commandAction(CMD_ZOOM_200)->trigger();
        QCOMPARE(timeToX(1.0) - timeToX(0.0), 256);
        frame.commandAction(CMD_ZOOM_50)->trigger();
        QCOMPARE(timeToX(1.0) - timeToX(0.0), 64);
        frame.songWindow()->toolbarButton(4)->click();   // fit: the 4 s fill the visible plot
        QCOMPARE(timeToX(songDuration()), LABEL_COLUMN_WIDTH + visiblePlotWidth());
    }

    // Playback from the song window on the null device, in MIDI mode (it needs notes only).
    void playIsStartedAndStoppedByThePlayButtonAndTheKeyAndAClickPlaysANote() {
        QTemporaryDir folder;   // the playback file's shared folder
        Paths savedPaths = paths;
        setSharedBasePath(folder.path().toStdString());
        makeFolder(paths.sharedFolder);
        makeSong(512, 3);
        commandOperations.playSong = playSong;
        commandOperations.pausePlayback = pausePlayback;
        displayModes.playbackMode = PLAYBACK_MODE_MIDI;
        MainFrame frame;
        frame.showFrame();
        QVERIFY(QTest::qWaitForWindowExposed(&frame));
        frame.showSongWindow();
        QApplication::processEvents();
        QToolButton* play = frame.songWindow()->toolbarButton(3);
        SongView* view = frame.songWindow()->songView();
        QCOMPARE(play->text(), QString("Play"));
        play->click();
        QVERIFY2(isPlaying(), lastMessageText().c_str());
        QCOMPARE(play->text(), QString("Stop"));
        QTest::keyClick(view, Qt::Key_P);
        QVERIFY(!isPlaying());
        QCOMPARE(play->text(), QString("Play"));

        // A mode change pauses; the repaint that follows plays on from the cursor.
        QTest::keyClick(view, Qt::Key_P);
        playbackState.cursor = 120;
        frame.commandAction(CMD_NOTE_MODE)->trigger();
        QVERIFY(!isPlaying());
        QTRY_VERIFY(isPlaying());
        QCOMPARE(playbackState.startCopy, 120);
        QCOMPARE(play->text(), QString("Stop"));

        QRectF bar = noteBarRect(1);
        QTest::mouseClick(view->viewport(), Qt::LeftButton, {}, bar.center().toPoint());
        QCOMPARE(selection.selectedNoteCount, 1);
        QCOMPARE(selection.selectedNotes[0], 1);
        QVERIFY(isPlaying());
        QCOMPARE(playbackState.preview, 1);
        QCOMPARE(playbackState.startCopy, 25);
        QTest::keyClick(view, Qt::Key_Escape);
        QVERIFY(!isPlaying());
        QTest::keyClick(view, Qt::Key_Return);   // the selected note again
        QCOMPARE(playbackState.startCopy, 25);
        stopPlayback();
        paths = savedPaths;
    }

    // A silent meter is only its background; each level's bar has its colour, and a narrow
    // meter still draws every bar.
    void meterColoursFollowTheLevels() {
        MeterWindow meter(nullptr, nullptr);
        meter.resize(200, 100);
        QImage image = meter.render();
        for (int y = 0; y < image.height(); y++)
            for (int x = 0; x < image.width(); x++)
                if (pixel(image, x, y) != QColor(32, 32, 32)) QFAIL(qPrintable(QString("drawn at %1,%2").arg(x).arg(y)));
        meter.resize(416, 271);
        setLevels({{0, 95}, {1, 94}, {2, 255}, {3, 1}});
        image = meter.render();
        MeterBar bar;
        auto colourOf = [&](int i, int v) {
            meterBar(i, v, image.width(), image.height(), &bar);
            return pixel(image, bar.left + bar.width / 2, image.height() - 9);
        };
        QCOMPARE(colourOf(0, 95), QColor(0, 255, 0));
        QCOMPARE(colourOf(1, 94), QColor(8, 255, 0));
        QCOMPARE(colourOf(2, 255), QColor(255, 0, 0));
        QCOMPARE(colourOf(3, 1), QColor(255, 4, 0));
        QCOMPARE(pixel(image, 8 + 5 * 400 / 32 + 6, image.height() - 9), QColor(32, 32, 32));   // bar 5: level 0
        meter.resize(40, 100);
        {
            std::lock_guard<std::mutex> guard(levelMeter.lock);
            std::fill(std::begin(levelMeter.levels), std::end(levelMeter.levels), 100);
        }
        image = meter.render();
        QCOMPARE(image.width(), 40);
        for (int i = 0; i < METER_BAR_COUNT; i++) {
            QVERIFY(meterBar(i, 100, 40, 100, &bar));
            QCOMPARE(pixel(image, bar.left, 100 - 9), QColor(0, 255, 0));
        }
    }

    void theHintShowsAfterFourSecondsOfLowLevelWhileRecording() {
        setManualClock(true);
        MeterWindow meter(nullptr, nullptr);
        meter.resize(400, 256);
        audioActivity.recording = true;
        setLevels({{31, 60}});
        auto hintInk = [&] {
            QImage image = meter.render();
            int ink = 0;
            for (int y = 10; y < 256 / 5 + 4; y++)
                for (int x = 0; x < 400; x++)
                    if (pixel(image, x, y) != QColor(32, 32, 32) && pixel(image, x, y).red() == pixel(image, x, y).blue())
                        ink++;
            return ink;
        };
        QCOMPARE(hintInk(), 0);
        advanceManualClock(4020);
        QVERIFY(hintInk() > 50);
        setLevels({{31, 95}});
        meter.render();   // this repaint draws a good level
        setLevels({{31, 60}});
        QCOMPARE(hintInk(), 0);
        audioActivity.recording = false;
    }

    void meterKeysGoToTheSongView() {
        KeyCatcher target;
        MeterWindow meter(nullptr, &target);
        QTest::keyClick(&meter, Qt::Key_Tab);
        QTest::keyClick(&meter, Qt::Key_P);
        QCOMPARE(target.keys, QList<int>({Qt::Key_Tab, Qt::Key_P}));
    }

    void theMetersSizeGoesToItsSettings() {
        MeterWindow meter(nullptr, nullptr);
        QCOMPARE(meter.size(), QSize(globalSettings.meterWidth, globalSettings.meterHeight));
        meter.show();
        QVERIFY(QTest::qWaitForWindowExposed(&meter));
        meter.resize(500, 300);
        QApplication::processEvents();
        QCOMPARE(globalSettings.meterWidth, 500);
        QCOMPARE(globalSettings.meterHeight, 300);
        QCOMPARE(meter.objectName(), QString("CSMeter"));
        QCOMPARE(meter.windowTitle(), QString("Recording Level"));
    }
};

int runSongViewTests(int argc, char** argv) {
    SongViewTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "songViewTest.moc"
