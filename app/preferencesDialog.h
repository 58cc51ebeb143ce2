#pragma once
// The preferences dialog ("Torvellan Melodrift preferences"): the tabs " Recording ",
// " Accuracy / Speed ", " Editing " and " General ", all four for the Preferences command, the
// accuracy page alone before opening or recording into an empty song, the recording page alone
// for Select Recording Source. The pages show what the engine's preferences state holds
// (audio/recordingSource.h) and hand every change back to it; OK confirms, Cancel puts back.

#include <QDialog>

class QCheckBox;
class QComboBox;
class QGroupBox;
class QLabel;
class QLineEdit;
class QListWidget;
class QProgressBar;
class QPushButton;
class QRadioButton;
class QSlider;
class QTabWidget;

class PreferencesDialog : public QDialog {
    Q_OBJECT
public:
    // The pages of pageSet (PreferencesPageSet), filled from the engine's state, which
    // beginPreferences has prepared.
    PreferencesDialog(int pageSet, QWidget* parent = nullptr);
    // The recording page shows the engine's page again (after a mixer change).
    void showRecordingPage();
    // The input's newest level, while the level monitor runs.
    void showInputLevel();
    QTabWidget* tabs() const { return tabWidget; }
    QPushButton* confirmButton() const { return okButton; }
    // OK: the pages' values go into the engine's copies before the dialog ends.
    void accept() override;

private:
    QWidget* makeRecordingPage();
    QWidget* makeAccuracyPage();
    QWidget* makeEditingPage();
    QWidget* makeGeneralPage();
    void showLatency();
    void takeAccuracyPage();

    int pageSet;
    bool filling = false;   // the widgets are being set from the engine: no change goes back
    QTabWidget* tabWidget = nullptr;
    QProgressBar* inputLevel = nullptr;   // the input's level before a recording; null when not monitored
    QPushButton* okButton = nullptr;
    // Recording page.
    QGroupBox* sourceGroup = nullptr;
    QListWidget* sourceList = nullptr;
    QSlider* levelSlider = nullptr;
    QPushButton* microphoneButton = nullptr;
    QComboBox* qualityList = nullptr;
    QLineEdit* folderField = nullptr;
    QPushButton* chooseButton = nullptr;
    QLabel* recordingTime = nullptr;
    // Accuracy / Speed page.
    QRadioButton* pitchRanges[3] = {};
    QCheckBox* enhancedAccuracy = nullptr;
    QCheckBox* boostSpeed = nullptr;
    QCheckBox* detectSyllables = nullptr;
    QCheckBox* disableWaveEditing = nullptr;
    QCheckBox* quickPrefs = nullptr;
    QLabel* latency = nullptr;
    // Editing page.
    QCheckBox* smoothLines = nullptr;
    QCheckBox* transparencies = nullptr;
    QCheckBox* gradients = nullptr;
    QLineEdit* defaultInstrument = nullptr;
    // General page.
    QCheckBox* splashScreen = nullptr;
    QCheckBox* translucentWindows = nullptr;
    QCheckBox* speedWarning = nullptr;
};

// Runs the dialog for pageSet, modal: 1 confirmed, 0 cancelled or already up. Installed as the
// engine's preferencesDialog.
int runPreferencesDialog(int pageSet);
// The dialog that runs now, or nullptr (tests).
PreferencesDialog* currentPreferencesDialog();
