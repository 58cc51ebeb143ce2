// The instrument window and the desktop pieces around MIDI import as the user meets them: the
// window's title, size, text line, drawing and buttons; the definition, learning, scale and
// recognition options dialogs; the help pages; the Open dialog's MIDI filter, and a MIDI file
// opened through the frame into a song window that draws its notes as bars.
#include <QCheckBox>
#include <QDoubleSpinBox>
#include <QFileDialog>
#include <QLabel>
#include <QLineEdit>
#include <QSpinBox>
#include <QTemporaryDir>
#include <QTest>
#include <QTextBrowser>
#include <QTimer>
#include <QToolButton>

#include "analysis/instrumentDefinitions.h"
#include "analysis/instrumentModels.h"
#include "analysis/pitchScale.h"
#include "analysis/recognitionOptions.h"
#include "app/fileDialogs.h"
#include "app/helpWindow.h"
#include "app/instrumentDialogs.h"
#include "app/instrumentWindow.h"
#include "app/mainFrame.h"
#include "app/recognitionOptionsDialog.h"
#include "app/songWindow.h"
#include "app/songViewPainter.h"
#include "appTestSupport.h"
#include "platform/media.h"
#include "platform/qt/qtMainLoop.h"
#include "playback/instrumentView.h"
#include "playback/midiImport.h"
#include "playback/midiOutput.h"
#include "playback/songViewGeometry.h"
#include "shell/commandTable.h"

static const char* const FLUTE_LINE =
    "Flute (Sine) - Generated. MIDI voice is 73. Max notes in chord is 1. Middle A is 440.00Hz. Semitone range is "
    "60 to 71. Score thresholds: 70.0%, 30.0%, 10.0%.";

class InstrumentWindowTest : public QObject {
    Q_OBJECT
private:
    QTemporaryDir folder;

    QString file(const QString& name) { return QDir(folder.path()).filePath(name); }
    // Two definitions, Flute (C4 to B4) and Bass Guitar (E1 to E2), in a file of the test's own.
    void makeDefinitions() {
        QVERIFY(createInstrumentDefinition("Flute", 60, 71, 1.0, 200));
        QVERIFY(createInstrumentDefinition("Bass Guitar", 28, 40, 2.0, 200));
    }

private slots:
    void init() {
        resetEngineState();
        freeInstrumentDefinitions();
        setInstrumentDefinitionsFile(file("CSInst.dat").toStdString());
        QFile::remove(file("CSInst.dat"));
        resetRecognitionOptions();
    }
    void cleanup() {
        delete instrumentWindow();
        freeInstrumentDefinitions();
        setInstrumentDefinitionsFile("");
        resetRecognitionOptions();
        resetMidiImport();
        resetEngineState();
    }

    void theWindowShowsTheCurrentDefinitionAndStepsThroughThem() {
        makeDefinitions();
        InstrumentWindow* window = showInstrumentWindow(nullptr);
        QCOMPARE(window->objectName(), QString("CSInst"));
        QCOMPARE(window->windowTitle(), QString("Cantoscope Instrument Definitions Display"));
        QCOMPARE(window->size(), QSize(1018, 742));
        // The new definition is the current one.
        QCOMPARE(instrumentDefinitions.current, 1);
        QVERIFY(window->textLine()->text().startsWith("Bass Guitar (Synthesised) - Generated. MIDI voice is 33."));
        QVERIFY(!window->button(1)->isEnabled());
        window->button(0)->click();
        QCOMPARE(instrumentDefinitions.current, 0);
        QCOMPARE(window->textLine()->text(), QString(FLUTE_LINE));
        QVERIFY(!window->button(0)->isEnabled());
        QVERIFY(window->button(1)->isEnabled());
        QCOMPARE(showInstrumentWindow(nullptr), window);   // brought up again, not made twice
    }

    void theDrawingShowsEachHarmonicWhereTheGeometryPutsIt() {
        makeDefinitions();
        InstrumentWindow* window = showInstrumentWindow(nullptr);
        window->showDefinition(0);
        QImage image = window->drawing()->render();
        const InstrumentDefinition& flute = instrumentDefinitions.definitions[0];
        InstrumentViewLayout layout = layoutInstrumentView(flute, image.width(), image.height());
        std::vector<HarmonicMark> marks = harmonicMarks(flute, layout);
        QCOMPARE(int(marks.size()), 24);
        QColor background(image.pixel(0, 0));
        for (const HarmonicMark& mark : marks) {
            QColor c(image.pixel(int((mark.x0 + mark.x1) / 2), int(mark.y)));
            QVERIFY2(c.blue() > c.red() + 40, qPrintable(QString("semitone %1").arg(mark.semitone)));
        }
        // Above C4's harmonic in its column lies nothing.
        double middle = layout.left + layout.columnWidth / 4;
        QCOMPARE(QColor(image.pixel(int(middle), int(instrumentFrequencyY(layout, 600.0)))), background);
    }

    void withoutDefinitionsTheWindowSaysSoAndOffersOnlyNewAndLearn() {
        InstrumentWindow* window = showInstrumentWindow(nullptr);
        QVERIFY(window->textLine()->text().startsWith("No instrument definitions are loaded."));
        for (int b : {0, 1, 4, 5}) QVERIFY(!window->button(b)->isEnabled());
        for (int b : {2, 3, 6}) QVERIFY(window->button(b)->isEnabled());
    }

    void deleteAsksFirstAndRewritesTheFile() {
        makeDefinitions();
        InstrumentWindow* window = showInstrumentWindow(nullptr);
        presetAnswers({ANSWER_NO});
        window->button(5)->click();
        QCOMPARE(lastMessageText(),
                 std::string("Delete the instrument definition \"Bass Guitar (Synthesised) - Generated\" with all its "
                             "learnt notes?"));
        QCOMPARE(int(instrumentDefinitions.definitions.size()), 2);
        presetAnswers({ANSWER_YES});
        window->button(5)->click();
        QCOMPARE(int(instrumentDefinitions.definitions.size()), 1);
        QCOMPARE(window->textLine()->text(), QString(FLUTE_LINE));
        QVERIFY(loadInstrumentDefinitions());
        QCOMPARE(int(instrumentDefinitions.definitions.size()), 1);
    }

    void theDefinitionDialogChecksItsParameters() {
        DefinitionDialog dialog(nullptr, "New Instrument Definition");
        struct Case {
            const char *name, *low, *high, *message;
        } refused[] = {
            {"  ", "C4", "B4", "Please name the instrument."},
            {"Flute", "H4", "B4", "Cannot interpret pitch in 'H4'"},
            {"Flute", "C5", "C4", "The lowest pitch (C5) is above the highest (C4)."},
        };
        for (const Case& c : refused) {
            dialog.nameEdit()->setText(c.name);
            dialog.lowEdit()->setText(c.low);
            dialog.highEdit()->setText(c.high);
            dialog.accept();
            QCOMPARE(dialog.result(), int(QDialog::Rejected));
            QCOMPARE(lastMessageText(), std::string(c.message));
        }
        dialog.nameEdit()->setText("Oboe");
        dialog.lowEdit()->setText("Bb3");
        dialog.highEdit()->setText("G6");
        dialog.durationBox()->setValue(1.5);
        dialog.levelBox()->setValue(120);
        dialog.accept();
        QCOMPARE(dialog.result(), int(QDialog::Accepted));
        const DefinitionParameters& p = dialog.parameters();
        QCOMPARE(p.name, std::string("Oboe"));
        QCOMPARE(p.lowSemitone, 58);
        QCOMPARE(p.highSemitone, 91);
        QCOMPARE(p.noteDuration, 1.5);
        QCOMPARE(p.level, 120);
    }

    void theScaleAndLearningDialogsOfferTheirFiles() {
        globalSettings.saveDirectory = folder.path().toStdString();
        QFileDialog* save = createScaleSaveDialog(nullptr, DefinitionParameters{"Flute", 60, 71, 1.0, 200});
        QCOMPARE(save->nameFilters(), QStringList({"MIDI files (*.mid)"}));
        QCOMPARE(save->selectedFiles().value(0), file("Flute_60_71_1.0_200.mid"));
        delete save;
        QFileDialog* learn = createLearnDialog(nullptr, 0);
        QCOMPARE(learn->nameFilters(), QStringList({"Instrument recordings (*.wav *.ftb)"}));
        QCOMPARE(learn->fileMode(), QFileDialog::ExistingFiles);
        delete learn;
    }

    void theSavedScaleCanBeHeardAndEscapeStopsIt() {
        installQtMainLoop();   // the device's timer and its end notice run in the box's event loop
        std::string path = file("scale.mid").toStdString();
        QCOMPARE(writeScaleMidiFile(path, "Flute", 60, 62, 0.5, 100), 1);
        auto escape = [] {
            if (QWidget* box = QApplication::activeModalWidget()) QTest::keyClick(box, Qt::Key_Escape);
        };
        QTimer::singleShot(100, escape);
        QCOMPARE(playScaleFile(nullptr, path), 0);
        // Left alone, the box closes itself when the device has played the three notes (the
        // guard stops a wait that never ends, failing the check).
        QTimer guard;
        guard.setSingleShot(true);
        connect(&guard, &QTimer::timeout, escape);
        guard.start(10000);
        QCOMPARE(playScaleFile(nullptr, path), 1);
        QCOMPARE(messageCount(), 0);
        QCOMPARE(playScaleFile(nullptr, file("missing.mid").toStdString()), 0);
        QCOMPARE(lastMessageText(), mediaErrorString(MEDIA_ERROR_FILE));
    }

    void learningWithASongOpenSaysSoOnceBeforeAskingForRecordings() {
        makeSong(64, 1);
        QCOMPARE(learnDefinitionsFromDialog(nullptr, 0), 0);
        QCOMPARE(messageCount(), 1);
        QCOMPARE(lastMessageText(), std::string("Please close the song before learning instruments."));
        audioActivity.opening = true;
        QCOMPARE(learnDefinitionsFromDialog(nullptr, 1), 0);
        QCOMPARE(lastMessageText(), std::string(WHILST_OPENING_TEXT));
    }

    void recognitionOptionsAreTakenOnOkOnly() {
        {
            RecognitionOptionsDialog dialog(nullptr, true);
            QVERIFY(dialog.checkBox("Remove Low Amplitudes")->isChecked());
            QVERIFY(!dialog.checkBox("Remove Bass Hum (Alg 1.5)")->isChecked());
            dialog.checkBox("Remove Bass Hum (Alg 1.5)")->setChecked(true);
            dialog.reject();
        }
        QVERIFY(!recognitionOptions.removeBassHum);
        RecognitionOptionsDialog dialog(nullptr, true);
        dialog.checkBox("Remove Bass Hum (Alg 1.5)")->setChecked(true);
        dialog.checkBox("Find Syllables")->setChecked(false);
        dialog.findChildren<QSpinBox*>().last()->setValue(30);   // the secondary cut-off level
        dialog.accept();
        QVERIFY(recognitionOptions.removeBassHum);
        QVERIFY(!recognitionOptions.findSyllables);
        // While learning, the learning copy of the cut-off level is the one changed.
        QCOMPARE(int(recognitionOptions.learningSecondaryCutOffLevel), 30);
        QCOMPARE(int(recognitionOptions.secondaryCutOffLevel), 45);
    }

    void theHelpAndTheRecordingTipsAreTheProgramsOwnPages() {
        HelpWindow* help = showHelpWindow(nullptr, HELP_PAGE_HELP);
        QCOMPARE(help->windowTitle(), QString("Torvellan Melodrift Help"));
        QString text = help->browser()->toPlainText();
        for (const char* heading : {"Opening a song", "Editing notes", "Correcting a melody", "Saving", "Instruments"})
            QVERIFY2(text.contains(heading), heading);
        help->showPage(HELP_PAGE_RECORDING_TIPS);
        QCOMPARE(help->windowTitle(), QString("Recording Tips"));
        QVERIFY(help->browser()->toPlainText().contains("Recording Level"));
        delete help;
    }

    void theOpenDialogOffersMidiFilesAndRemembersTheFilter() {
        globalSettings.openFilter = 2;
        QFileDialog* open = createOpenDialog(nullptr);
        QCOMPARE(open->nameFilters(), QStringList({"Wave audio files (*.wav)", "MIDI files (*.mid *.midi)"}));
        QCOMPARE(open->selectedNameFilter(), QString("MIDI files (*.mid *.midi)"));
        delete open;
    }

    void aMidiFileOpensIntoASongWindowOfBarsAndTheWindowMenuShowsTheInstruments() {
        // A format-0 file of 96 ticks per quarter: C4 for a quarter, then E4 for a half.
        const unsigned char bytes[] = {'M', 'T', 'h', 'd', 0, 0, 0, 6, 0, 0, 0, 1, 0, 96, 'M', 'T', 'r', 'k', 0, 0, 0, 21,
                                       0, 0x90, 60, 100, 0x60, 0x80, 60, 0, 0, 0x90, 64, 100, 0x81, 0x40, 64, 0,
                                       0, 0xFF, 0x2F, 0};
        QFile midi(file("tune.mid"));
        QVERIFY(midi.open(QIODevice::WriteOnly));
        midi.write(reinterpret_cast<const char*>(bytes), sizeof bytes);
        midi.close();
        commandOperations.readMidiFile = importMidiFile;
        generalSettings.drawSmoothLines = false;
        generalSettings.drawTransparencies = false;
        generalSettings.drawGradients = false;
        displayModes.noteMode = NOTE_MODE_DETAIL;
        MainFrame frame;
        frame.showFrame();
        queueFilesToOpen({file("tune.mid").toStdString()});
        workOffOpenQueue();
        QVERIFY(frame.songWindow());
        QCOMPARE(noteList.count, 2);
        QCOMPARE(displayModes.playbackMode, PLAYBACK_MODE_MIDI);
        // No input level to show for a song of notes only.
        QVERIFY(frame.songWindow()->meterWindow());
        QVERIFY(!frame.songWindow()->meterWindow()->isVisible());
        // Detail mode has no sung pitch to draw: the notes are bars.
        QImage image(LABEL_COLUMN_WIDTH + 600, 500, QImage::Format_RGB32);
        QVERIFY(paintSongView(image));
        QCOMPARE(QColor(image.pixel(timeToX(0.3), pitchToY(pitchToFrequency(60)))), songViewColours().note);
        QCOMPARE(QColor(image.pixel(timeToX(1.2), pitchToY(pitchToFrequency(64)))), songViewColours().note);

        frame.runCommand(CMD_INSTRUMENTS);
        QVERIFY(instrumentWindow() && instrumentWindow()->isVisible());
    }
};

int runInstrumentWindowTests(int argc, char** argv) {
    InstrumentWindowTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "instrumentWindowTest.moc"
