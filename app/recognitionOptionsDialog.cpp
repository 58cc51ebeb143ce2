// The "Recognition options" dialog. The switches are one table of labels and option fields,
// so that showing them and taking them back cannot drift apart.
#include "app/recognitionOptionsDialog.h"

#include <QCheckBox>
#include <QDialogButtonBox>
#include <QDoubleSpinBox>
#include <QFormLayout>
#include <QGridLayout>
#include <QGroupBox>
#include <QLabel>
#include <QSpinBox>
#include <QVBoxLayout>

#include "analysis/recognitionOptions.h"

namespace {

struct OptionSwitch {
    const char* label;                     // the dialog's label, word for word
    bool RecognitionOptions::*option;
    bool frequencyTables;                  // the frequency-table part; else recognition's
};

const OptionSwitch SWITCHES[] = {
    {"Power Spectrum Analysis", &RecognitionOptions::powerSpectrumAnalysis, true},
    {"Monophonic recognition (Voice, trumpet etc.)", &RecognitionOptions::monophonicRecognition, true},
    {"Remove Low Amplitudes", &RecognitionOptions::removeLowAmplitudes, true},
    {"Remove Bass Noise", &RecognitionOptions::removeBassNoise, true},
    {"Remove Bass Hum (Alg 1.5)", &RecognitionOptions::removeBassHum, true},
    {"Remove Attack Interference", &RecognitionOptions::removeAttackInterference, true},
    {"Strip Surrounding Amplitudes", &RecognitionOptions::stripSurroundingAmplitudes, true},
    {"Remove Amplitude Blips", &RecognitionOptions::removeAmplitudeBlips, true},
    {"Remove Weak Note Trails", &RecognitionOptions::removeWeakNoteTrails, true},
    {"Remove Note Joins", &RecognitionOptions::removeNoteJoins, true},
    {"Remove Excessive Attack Noise", &RecognitionOptions::removeExcessiveAttackNoise, true},
    {"Analyse score", &RecognitionOptions::analyseScore, false},
    {"Compand", &RecognitionOptions::compand, false},
    {"Append 'SSS' Sounds to Notes", &RecognitionOptions::appendSibilants, false},
    {"Flatten Vibrato (Alg 2+3)", &RecognitionOptions::flattenVibrato, false},
    {"Flatten Glissando", &RecognitionOptions::flattenGlissando, false},
    {"Remove Low Amplitude Notes", &RecognitionOptions::removeLowAmplitudeNotes, false},
    {"Find Syllables", &RecognitionOptions::findSyllables, false},
    {"Check &pitch drop and intial noise", &RecognitionOptions::checkPitchDrop, false},
    {"Search ahead for better matches before coming to a decision", &RecognitionOptions::searchAhead, false},
    {"Allow overlapping harmonics (repeated notes)", &RecognitionOptions::allowOverlappingHarmonics, false},
    {"Allow harmonics containing gaps", &RecognitionOptions::allowHarmonicsContainingGaps, false},
    {"Use longest harmonic duration to calculate note length (as opposed to common average)",
     &RecognitionOptions::useLongestHarmonicDuration, false},
    {"Adjust Harmonic Fit Duration (use getNoteStrength data if close to instrument defined duration)",
     &RecognitionOptions::adjustHarmonicFitDuration, false},
};

QDoubleSpinBox* decimalBox(double low, double high, int decimals, double value) {
    auto* box = new QDoubleSpinBox;
    box->setRange(low, high);
    box->setDecimals(decimals);
    box->setSingleStep(decimals > 1 ? 0.05 : 0.5);
    box->setValue(value);
    return box;
}

QSpinBox* wholeBox(int low, int high, int value, const char* suffix) {
    auto* box = new QSpinBox;
    box->setRange(low, high);
    box->setSuffix(suffix);
    box->setValue(value);
    return box;
}

}  // namespace

RecognitionOptionsDialog::RecognitionOptionsDialog(QWidget* parent, bool learning)
    : QDialog(parent), forLearning(learning) {
    setObjectName("recognitionOptions");
    setWindowTitle("Recognition options");
    // The analysis takes the block duration and range from the preferences: these are the
    // values it will use.
    applyAnalysisPreferences();
    const RecognitionOptions& o = recognitionOptions;

    auto* tables = new QGroupBox("Frequency tables");
    auto* tablesForm = new QFormLayout;
    int blocksPerSecond = o.blockDuration > 0 ? int(1.0f / o.blockDuration + 0.5f) : 0;
    tablesForm->addRow("Block duration", new QLabel(QString("1 / %1 secs (1/%1), from the preferences").arg(blocksPerSecond)));
    tablesForm->addRow("Hz", new QLabel(QString("%1 to %2 Hz, from the preferences")
                                            .arg(double(o.lowestFrequency), 0, 'f', 1)
                                            .arg(double(o.highestFrequency), 0, 'f', 1)));
    tablesForm->addRow("Number of semitone divisions", new QLabel(QString::number(double(o.semitoneDivisions))));
    boost = decimalBox(0.1, 100.0, 1, double(o.amplitudeBoost));
    tablesForm->addRow("Amplitude boost", boost);
    spike = decimalBox(0.0, 1.0, 2, double(o.spikeThreshold));
    tablesForm->addRow("Ignore amplitude spike threshold (1 = none ignored)", spike);
    limiter = wholeBox(0, 100, int(o.changeLimiter), " %");
    tablesForm->addRow("Horz. amplitude change limiter", limiter);
    cutOff = wholeBox(0, 100, forLearning ? o.learningSecondaryCutOffLevel : o.secondaryCutOffLevel, " %");
    tablesForm->addRow("Secondary auto cut off level", cutOff);

    auto* recognition = new QGroupBox("Recognition");
    auto* recognitionForm = new QFormLayout;
    lateHarmonics = decimalBox(0.0, 1.0, 3, double(o.lateHarmonicsPeriod));
    lateHarmonics->setSuffix(" s");
    recognitionForm->addRow("Maximum period for late harmonics to begin", lateHarmonics);

    auto* tableSwitches = new QVBoxLayout;
    auto* recognitionSwitches = new QVBoxLayout;
    for (const OptionSwitch& s : SWITCHES) {
        auto* box = new QCheckBox(s.label);
        box->setObjectName(s.label);
        box->setChecked(o.*s.option);
        (s.frequencyTables ? tableSwitches : recognitionSwitches)->addWidget(box);
        boxes.append(box);
    }
    auto* tablesLayout = new QVBoxLayout(tables);
    tablesLayout->addLayout(tablesForm);
    tablesLayout->addLayout(tableSwitches);
    auto* recognitionLayout = new QVBoxLayout(recognition);
    recognitionLayout->addLayout(recognitionSwitches);
    recognitionLayout->addLayout(recognitionForm);

    auto* buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel);
    connect(buttons, &QDialogButtonBox::accepted, this, &QDialog::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    auto* grid = new QGridLayout(this);
    grid->addWidget(tables, 0, 0);
    grid->addWidget(recognition, 0, 1);
    grid->addWidget(buttons, 1, 0, 1, 2);
}

QCheckBox* RecognitionOptionsDialog::checkBox(const QString& label) const {
    for (QCheckBox* box : boxes)
        if (box->text() == label) return box;
    return nullptr;
}

void RecognitionOptionsDialog::accept() {
    RecognitionOptions& o = recognitionOptions;
    for (int i = 0; i < boxes.size(); i++) o.*SWITCHES[i].option = boxes[i]->isChecked();
    o.amplitudeBoost = float(boost->value());
    o.spikeThreshold = float(spike->value());
    o.changeLimiter = unsigned(limiter->value());
    (forLearning ? o.learningSecondaryCutOffLevel : o.secondaryCutOffLevel) = uint8_t(cutOff->value());
    o.lateHarmonicsPeriod = float(lateHarmonics->value());
    QDialog::accept();
}

bool runRecognitionOptionsDialog(QWidget* parent, bool forLearning) {
    RecognitionOptionsDialog dialog(parent, forLearning);
    return dialog.exec() == QDialog::Accepted;
}
