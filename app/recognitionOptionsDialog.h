#pragma once
// The "Recognition options" dialog: the switches and values of the frequency tables and of note
// recognition, shown before an instrument is learnt from a single recording. OK puts them into
// the program's recognition options; Cancel leaves them as they were. The block duration and
// the frequency range come from the preferences' pitch range and are shown, not edited.

#include <QDialog>

class QCheckBox;
class QDoubleSpinBox;
class QSpinBox;

class RecognitionOptionsDialog : public QDialog {
    Q_OBJECT
public:
    // forLearning: the secondary cut-off level shown and changed is the learning copy.
    RecognitionOptionsDialog(QWidget* parent, bool forLearning);
    // The check box of an option by its label as the dialog shows it; nullptr for none.
    QCheckBox* checkBox(const QString& label) const;

    void accept() override;

private:
    bool forLearning;
    QList<QCheckBox*> boxes;   // in the order of the option table
    QDoubleSpinBox* boost;
    QDoubleSpinBox* spike;
    QSpinBox* limiter;
    QSpinBox* cutOff;
    QDoubleSpinBox* lateHarmonics;
};

// Shows the dialog; true when the user pressed OK.
bool runRecognitionOptionsDialog(QWidget* parent, bool forLearning);
