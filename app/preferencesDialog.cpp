// The preferences dialog: its pages are thin views of the engine's preferences state.
#include "app/preferencesDialog.h"

#include <mutex>

#include <QCheckBox>
#include <QComboBox>
#include <QDialogButtonBox>
#include <QFileDialog>
#include <QFormLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QListWidget>
#include <QProgressBar>
#include <QPushButton>
#include <QRadioButton>
#include <QSlider>
#include <QTabWidget>
#include <QVBoxLayout>

#include "app/mainFrame.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/recording.h"
#include "audio/recordingSource.h"

static PreferencesDialog* runningDialog = nullptr;

PreferencesDialog* currentPreferencesDialog() { return runningDialog; }

static QString text(const std::string& s) { return QString::fromStdString(s); }

PreferencesDialog::PreferencesDialog(int set, QWidget* parent) : QDialog(parent), pageSet(set) {
    setObjectName("PreferencesDialog");
    setWindowTitle(PREFERENCES_TITLE);
    auto* layout = new QVBoxLayout(this);
    tabWidget = new QTabWidget(this);
    layout->addWidget(tabWidget);
    if (set == PAGE_SET_ALL || set == PAGE_SET_SOURCE) tabWidget->addTab(makeRecordingPage(), " Recording ");
    if (set != PAGE_SET_SOURCE) tabWidget->addTab(makeAccuracyPage(), " Accuracy / Speed ");
    if (set == PAGE_SET_ALL) {
        tabWidget->addTab(makeEditingPage(), " Editing ");
        tabWidget->addTab(makeGeneralPage(), " General ");
    }
    // Setting up a microphone needs its level: the input is shown while the dialog is up.
    if (set != PAGE_SET_OPENING && startLevelMonitor()) {
        auto* row = new QHBoxLayout;
        row->addWidget(new QLabel("Input level:", this));
        inputLevel = new QProgressBar(this);
        inputLevel->setObjectName("inputLevel");
        inputLevel->setRange(0, LEVEL_METER_FULL_SCALE);
        inputLevel->setTextVisible(false);
        row->addWidget(inputLevel, 1);
        layout->addLayout(row);
    }
    auto* buttons = new QDialogButtonBox(this);
    okButton = buttons->addButton(set == PAGE_SET_OPENING ? "&Open" : set == PAGE_SET_RECORDING ? "Rec&ord" : "&OK",
                                  QDialogButtonBox::AcceptRole);
    okButton->setDefault(true);
    buttons->addButton(QDialogButtonBox::Cancel);
    connect(buttons, &QDialogButtonBox::accepted, this, &QDialog::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    layout->addWidget(buttons);
}

QWidget* PreferencesDialog::makeRecordingPage() {
    auto* page = new QWidget;
    auto* layout = new QVBoxLayout(page);
    sourceGroup = new QGroupBox(page);
    auto* sourceLayout = new QHBoxLayout(sourceGroup);
    sourceList = new QListWidget(sourceGroup);
    sourceList->setObjectName("sourceList");
    levelSlider = new QSlider(Qt::Vertical, sourceGroup);
    levelSlider->setObjectName("levelSlider");
    // The engine's positions run from 0 at the top (loudest) to 255 at the bottom.
    levelSlider->setInvertedAppearance(true);
    levelSlider->setTickPosition(QSlider::TicksRight);
    levelSlider->setTickInterval(SOURCE_SLIDER_TICKS);
    microphoneButton = new QPushButton(MICROPHONE_BUTTON_TEXT, sourceGroup);
    auto* listColumn = new QVBoxLayout;
    listColumn->addWidget(sourceList);
    listColumn->addWidget(microphoneButton);
    sourceLayout->addLayout(listColumn, 1);
    sourceLayout->addWidget(levelSlider);
    layout->addWidget(sourceGroup);

    auto* form = new QFormLayout;
    qualityList = new QComboBox(page);
    qualityList->setObjectName("qualityList");
    form->addRow("Recording quality:", qualityList);
    auto* folderRow = new QHBoxLayout;
    folderField = new QLineEdit(page);
    folderField->setObjectName("folderField");
    chooseButton = new QPushButton("Ch&oose...", page);
    folderRow->addWidget(folderField, 1);
    folderRow->addWidget(chooseButton);
    form->addRow("Folder for working files:", folderRow);
    recordingTime = new QLabel(page);
    recordingTime->setObjectName("recordingTime");
    form->addRow("", recordingTime);
    layout->addLayout(form);

    connect(sourceList, &QListWidget::currentRowChanged, this, [this](int row) {
        if (filling || row < 0) return;
        setRecordingSource(row, -1, false);
        showRecordingPage();
    });
    connect(levelSlider, &QSlider::valueChanged, this, [this](int position) {
        if (filling) return;
        setRecordingLevelFromSlider(position);
    });
    connect(microphoneButton, &QPushButton::clicked, this, [this] {
        setUpMicrophone();
        showRecordingPage();
    });
    connect(qualityList, &QComboBox::currentIndexChanged, this, [this](int entry) {
        if (filling) return;
        chooseRecordingQuality(entry);
        showRecordingPage();
    });
    connect(chooseButton, &QPushButton::clicked, this, [this] {
        QString folder = QFileDialog::getExistingDirectory(this, "Folder for working files", folderField->text());
        if (folder.isEmpty()) return;
        chooseSharedFolder(folder.toStdString());
        showRecordingPage();
    });
    showRecordingPage();
    return page;
}

void PreferencesDialog::showInputLevel() {
    if (!inputLevel) return;
    std::lock_guard<std::mutex> guard(levelMeter.lock);
    inputLevel->setValue(levelMeter.levels[LEVEL_METER_BARS - 1]);
}

void PreferencesDialog::showRecordingPage() {
    if (!sourceList) return;
    const RecordingPage& p = recordingPage;
    filling = true;
    sourceGroup->setTitle(text(p.groupTitle.empty() ? std::string(SOURCE_GROUP_TITLE) : p.groupTitle));
    sourceList->clear();
    for (const std::string& name : p.sources) sourceList->addItem(text(name));
    sourceList->setCurrentRow(p.selectedSource);
    sourceList->setEnabled(p.sourcesEnabled);
    levelSlider->setRange(p.sliderMinimum, SOURCE_SLIDER_TOP);
    levelSlider->setValue(p.sliderPosition);
    levelSlider->setEnabled(p.sourcesEnabled);
    microphoneButton->setEnabled(p.sourcesEnabled);
    qualityList->clear();
    for (const std::string& label : p.qualityLabels) qualityList->addItem(text(label));
    for (size_t i = 0; i < p.qualities.size(); i++)
        if (p.qualities[i] == preferencesState.global.inputWaveQuality) qualityList->setCurrentIndex(int(i));
    qualityList->setEnabled(p.qualityEnabled);
    folderField->setText(text(preferencesState.sharedFolder));
    folderField->setEnabled(p.folderEnabled);
    chooseButton->setEnabled(p.folderEnabled);
    recordingTime->setText(text(p.recordingTime));
    recordingTime->setEnabled(p.folderEnabled);
    filling = false;
}

QWidget* PreferencesDialog::makeAccuracyPage() {
    const PreferencesState& s = preferencesState;
    auto* page = new QWidget;
    auto* layout = new QVBoxLayout(page);
    auto* rangeGroup = new QGroupBox("Pitch range", page);
    auto* rangeLayout = new QVBoxLayout(rangeGroup);
    const char* ranges[3] = {"Mid to high (E3 to C8)", "Low to Mid (E2 to E6)", "Very Low (A0 to E5)"};
    for (int i = 0; i < 3; i++) {
        pitchRanges[i] = new QRadioButton(ranges[i], rangeGroup);
        pitchRanges[i]->setChecked(s.general.pitchRange == i);
        rangeLayout->addWidget(pitchRanges[i]);
        connect(pitchRanges[i], &QRadioButton::toggled, this, [this] { showLatency(); });
    }
    layout->addWidget(rangeGroup);
    enhancedAccuracy = new QCheckBox("&Enhanced pitch accuracy", page);
    enhancedAccuracy->setChecked(s.general.enhancedPitchAccuracy);
    boostSpeed = new QCheckBox("&Boost speed", page);
    boostSpeed->setChecked(s.global.boostSpeed);
    detectSyllables = new QCheckBox("&Detect syllables", page);
    detectSyllables->setChecked(s.general.detectSyllables);
    disableWaveEditing = new QCheckBox("Disable &wave editing (faster recognition)", page);
    disableWaveEditing->setChecked(s.general.disableWaveEditing);
    for (QCheckBox* box : {enhancedAccuracy, boostSpeed, detectSyllables, disableWaveEditing}) {
        layout->addWidget(box);
        connect(box, &QCheckBox::toggled, this, [this] { showLatency(); });
    }
    latency = new QLabel(page);
    latency->setObjectName("latency");
    layout->addWidget(latency);
    quickPrefs = new QCheckBox(QUICK_PREFERENCES_CHECK_TEXT, page);
    quickPrefs->setChecked(s.general.quickPrefs);
    layout->addWidget(quickPrefs);
    layout->addStretch(1);
    showLatency();
    return page;
}

// The accuracy page's values into the engine's copies.
void PreferencesDialog::takeAccuracyPage() {
    if (!enhancedAccuracy) return;
    PreferencesState& s = preferencesState;
    for (int i = 0; i < 3; i++)
        if (pitchRanges[i]->isChecked()) s.general.pitchRange = i;
    s.general.enhancedPitchAccuracy = enhancedAccuracy->isChecked();
    s.global.boostSpeed = boostSpeed->isChecked();
    s.general.detectSyllables = detectSyllables->isChecked();
    s.general.disableWaveEditing = disableWaveEditing->isChecked();
    s.general.quickPrefs = quickPrefs->isChecked();
}

void PreferencesDialog::showLatency() {
    takeAccuracyPage();
    latency->setText(text(minimumLatencyText(preferencesState.general, preferencesState.global)));
    if (recordingTime) {
        updateRecordingTime();
        recordingTime->setText(text(recordingPage.recordingTime));
    }
}

QWidget* PreferencesDialog::makeEditingPage() {
    const PreferencesState& s = preferencesState;
    auto* page = new QWidget;
    auto* layout = new QVBoxLayout(page);
    smoothLines = new QCheckBox("Draw &smooth lines", page);
    smoothLines->setChecked(s.general.drawSmoothLines);
    transparencies = new QCheckBox("Draw &transparencies", page);
    transparencies->setChecked(s.general.drawTransparencies);
    gradients = new QCheckBox("Draw &gradients", page);
    gradients->setChecked(s.general.drawGradients);
    for (QCheckBox* box : {smoothLines, transparencies, gradients}) layout->addWidget(box);
    auto* form = new QFormLayout;
    defaultInstrument = new QLineEdit(text(s.global.defaultInstrument), page);
    defaultInstrument->setMaxLength(MAX_DEFAULT_INSTRUMENT_CHARACTERS);
    form->addRow("Instrument of a new song:", defaultInstrument);
    layout->addLayout(form);
    layout->addStretch(1);
    return page;
}

QWidget* PreferencesDialog::makeGeneralPage() {
    const PreferencesState& s = preferencesState;
    auto* page = new QWidget;
    auto* layout = new QVBoxLayout(page);
    splashScreen = new QCheckBox("Display &splash screen", page);
    splashScreen->setChecked(s.general.splashScreen);
    translucentWindows = new QCheckBox("&Translucent windows", page);
    translucentWindows->setChecked(s.global.translucentWindows);
    speedWarning = new QCheckBox("Show the &information when a recording falls behind", page);
    speedWarning->setChecked(s.global.showSpeedWarning);
    for (QCheckBox* box : {splashScreen, translucentWindows, speedWarning}) layout->addWidget(box);
    layout->addStretch(1);
    return page;
}

void PreferencesDialog::accept() {
    PreferencesState& s = preferencesState;
    takeAccuracyPage();
    if (smoothLines) {
        s.general.drawSmoothLines = smoothLines->isChecked();
        s.general.drawTransparencies = transparencies->isChecked();
        s.general.drawGradients = gradients->isChecked();
        s.global.defaultInstrument = defaultInstrument->text().toStdString();
    }
    if (splashScreen) {
        s.general.splashScreen = splashScreen->isChecked();
        s.global.translucentWindows = translucentWindows->isChecked();
        s.global.showSpeedWarning = speedWarning->isChecked();
    }
    QDialog::accept();
}

int runPreferencesDialog(int pageSet) {
    if (!beginPreferences(pageSet)) return 0;
    PreferencesDialog dialog(pageSet, mainFrame());
    runningDialog = &dialog;
    recordingPageChanged = [] {
        if (runningDialog) runningDialog->showRecordingPage();
    };
    void (*levelChanged)() = recordingHooks.levelChanged;
    recordingHooks.levelChanged = [] {
        if (runningDialog) runningDialog->showInputLevel();
    };
    int result = dialog.exec();
    stopLevelMonitor();
    recordingHooks.levelChanged = levelChanged;
    recordingPageChanged = nullptr;
    runningDialog = nullptr;
    if (result == QDialog::Accepted) confirmPreferences();
    else cancelPreferences();
    return result == QDialog::Accepted ? 1 : 0;
}
