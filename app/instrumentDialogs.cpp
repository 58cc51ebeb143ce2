// The instrument window's dialogs and the commands behind them. The definitions themselves
// are the engine's: these functions ask, then call createInstrumentDefinition,
// learnInstrumentNotes, deleteInstrumentDefinition and writeScaleMidiFile.
#include "app/instrumentDialogs.h"

#include <QDialogButtonBox>
#include <QDir>
#include <QDoubleSpinBox>
#include <QFileDialog>
#include <QFileInfo>
#include <QFormLayout>
#include <QLineEdit>
#include <QMessageBox>
#include <QSpinBox>

#include "analysis/instrumentDefinitions.h"
#include "analysis/instrumentLearning.h"
#include "analysis/instrumentModels.h"
#include "app/recognitionOptionsDialog.h"
#include "audio/audioActivity.h"
#include "notes/noteList.h"
#include "platform/media.h"
#include "platform/ui.h"
#include "playback/midiOutput.h"
#include "playback/playback.h"
#include "playback/songViewGeometry.h"
#include "resources/strings.h"
#include "shell/commandTable.h"
#include "shell/settings.h"
#include "store/song.h"

// The filter name of the learning dialog.
static const int LEARN_FILTER_STRING = 189;

DefinitionDialog::DefinitionDialog(QWidget* parent, const QString& title) : QDialog(parent) {
    setObjectName("definitionDialog");
    setWindowTitle(title);
    name = new QLineEdit("Flute");
    low = new QLineEdit("C4");
    high = new QLineEdit("B4");
    duration = new QDoubleSpinBox;
    duration->setRange(0.1, MAX_NOTE_DURATION);
    duration->setDecimals(1);
    duration->setSingleStep(0.1);
    duration->setSuffix(" s");
    duration->setValue(1.0);
    level = new QSpinBox;
    level->setRange(1, 255);
    level->setValue(200);
    auto* form = new QFormLayout(this);
    form->addRow("Instrument (General MIDI name)", name);
    form->addRow("Lowest pitch", low);
    form->addRow("Highest pitch", high);
    form->addRow("Note duration", duration);
    form->addRow("Level", level);
    auto* buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel);
    connect(buttons, &QDialogButtonBox::accepted, this, &QDialog::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    form->addRow(buttons);
}

void DefinitionDialog::accept() {
    DefinitionParameters p;
    p.name = name->text().trimmed().toStdString();
    if (p.name.empty()) {
        showMessage(MESSAGE_INFORMATION, "Please name the instrument.");
        return;
    }
    p.lowSemitone = parsePitchName(low->text().toStdString(), 1);
    if (!p.lowSemitone) return;
    p.highSemitone = parsePitchName(high->text().toStdString(), 1);
    if (!p.highSemitone) return;
    if (p.lowSemitone > p.highSemitone) {
        showMessage(MESSAGE_INFORMATION, "The lowest pitch (" + low->text().toStdString() + ") is above the highest (" +
                                             high->text().toStdString() + ").");
        return;
    }
    p.noteDuration = duration->value();
    p.level = level->value();
    chosen = p;
    QDialog::accept();
}

int createDefinitionFromDialog(QWidget* parent) {
    DefinitionDialog dialog(parent, "New Instrument Definition");
    if (dialog.exec() != QDialog::Accepted) return 0;
    const DefinitionParameters& p = dialog.parameters();
    return createInstrumentDefinition(p.name, p.lowSemitone, p.highSemitone, p.noteDuration, uint32_t(p.level));
}

QFileDialog* createLearnDialog(QWidget* parent, int replace) {
    auto* dialog = new QFileDialog(parent, replace ? "Replace Learnt Notes" : "Learn Instrument Notes");
    dialog->setObjectName("learnDialog");
    dialog->setOption(QFileDialog::DontUseNativeDialog);
    dialog->setAcceptMode(QFileDialog::AcceptOpen);
    dialog->setFileMode(QFileDialog::ExistingFiles);
    dialog->setNameFilters({QString::fromStdString(resourceString(LEARN_FILTER_STRING)) + " (*.wav *.ftb)"});
    QString folder = QString::fromStdString(globalSettings.openDirectory);
    dialog->setDirectory(!folder.isEmpty() && QDir(folder).exists() ? folder : QDir::currentPath());
    return dialog;
}

// The wait cursor while the recordings are analysed, taken back on every return.
struct Waiting {
    Waiting() { setWaitCursor(true); }
    ~Waiting() { setWaitCursor(false); }
};

int learnDefinitionsFromDialog(QWidget* parent, int replace) {
    // Learning analyses in the song's stores, which a recording or an opening is filling; an
    // open song is said once, not once for every recording chosen.
    if (refuseWhileBusy()) return 0;
    if (song.blockCount > 0) {
        showMessage(MESSAGE_ERROR, CLOSE_SONG_BEFORE_LEARNING_TEXT);
        return 0;
    }
    QFileDialog* dialog = createLearnDialog(parent, replace);
    QStringList files;
    if (dialog->exec() == QDialog::Accepted) files = dialog->selectedFiles();
    delete dialog;
    if (files.isEmpty()) return 0;
    if (files.size() == 1 && files[0].endsWith(".wav", Qt::CaseInsensitive) &&
        !runRecognitionOptionsDialog(parent, true))
        return 0;
    std::vector<std::string> paths;
    for (const QString& file : files) paths.push_back(file.toStdString());
    Waiting waiting;
    return learnInstrumentNotes(paths, replace);
}

int deleteCurrentDefinition() {
    InstrumentDefinitions& t = instrumentDefinitions;
    if (t.current < 0 || t.current >= int(t.definitions.size())) return 0;
    const InstrumentDefinition& d = t.definitions[size_t(t.current)];
    if (!askYesNo("Delete the instrument definition \"" + d.name + " (" + d.kind + ") - " + d.source +
                  "\" with all its learnt notes?"))
        return 0;
    return deleteInstrumentDefinition(t.current);
}

QFileDialog* createScaleSaveDialog(QWidget* parent, const DefinitionParameters& p) {
    auto* dialog = new QFileDialog(parent, "Save Scale MIDI File");
    dialog->setObjectName("scaleSaveDialog");
    dialog->setOption(QFileDialog::DontUseNativeDialog);
    dialog->setAcceptMode(QFileDialog::AcceptSave);
    dialog->setFileMode(QFileDialog::AnyFile);
    dialog->setNameFilters({QString("%1 (*.mid)").arg(MIDI_FILES_FILTER_NAME)});
    dialog->setDefaultSuffix("mid");
    QString folder = QString::fromStdString(globalSettings.saveDirectory);
    dialog->setDirectory(!folder.isEmpty() && QDir(folder).exists() ? folder : QDir::currentPath());
    dialog->selectFile(QString::fromStdString(
        scaleMidiFileName(p.name, p.lowSemitone, p.highSemitone, p.noteDuration, p.level)));
    return dialog;
}

int writeScaleFromDialog(QWidget* parent) {
    DefinitionDialog parameters(parent, "Scale MIDI File");
    if (parameters.exec() != QDialog::Accepted) return 0;
    const DefinitionParameters& p = parameters.parameters();
    QFileDialog* dialog = createScaleSaveDialog(parent, p);
    QString path;
    if (dialog->exec() == QDialog::Accepted && !dialog->selectedFiles().isEmpty()) path = dialog->selectedFiles().first();
    delete dialog;
    if (path.isEmpty()) return 0;
    if (!writeScaleMidiFile(path.toStdString(), p.name, p.lowSemitone, p.highSemitone, p.noteDuration, p.level))
        return 0;
    std::string low = pitchName(p.lowSemitone, true, PITCH_NAMES_DIATONIC);
    std::string high = pitchName(p.highSemitone, true, PITCH_NAMES_DIATONIC);
    if (askYesNo("The scale from " + low + " to " + high + " is saved in '" + path.toStdString() +
                 "'. Play it on the instrument and record it, then save the recording under a name such as " +
                 p.name + "_Real_Studio_440.0_" + low + "_" + high +
                 "_0.wav and learn it with Learn.\n\nListen to the scale now?"))
        playScaleFile(parent, path.toStdString());
    return 1;
}

// The box shown while the scale plays; the device's end notice closes it.
static QMessageBox* scaleBox = nullptr;

int playScaleFile(QWidget* parent, const std::string& path) {
    stopPlayback();   // the sequencer is one device: the song's MIDI playback lets it go
    int device = -1;
    int result = mediaOpen(MEDIA_TYPE_SEQUENCER, path, &device);
    if (result == MEDIA_OK) result = mediaPlay(device, [](int) {
        if (scaleBox) scaleBox->accept();
    });
    if (result != MEDIA_OK) {
        if (device >= 0) mediaClose(device);
        showMessage(MESSAGE_ERROR, mediaErrorString(result));
        return 0;
    }
    QMessageBox box(QMessageBox::Information, "Scale MIDI File", "Playing the scale. Press Escape to stop.",
                    QMessageBox::Cancel, parent);
    box.setObjectName("scalePlayingBox");
    scaleBox = &box;
    int finished = box.exec() == QDialog::Accepted;
    scaleBox = nullptr;
    mediaClose(device);
    return finished;
}
