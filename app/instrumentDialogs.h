#pragma once
// The instrument window's commands that need the user: the parameters of a new definition or of
// the chromatic scale to record one from, the scale's Save dialog, the recordings to learn from
// (with the "Recognition options" dialog before a single wave), and deleting a definition.

#include <string>

#include <QDialog>

class QDoubleSpinBox;
class QFileDialog;
class QLineEdit;
class QSpinBox;

// What a new definition, and the scale it is learnt from, are made of.
struct DefinitionParameters {
    std::string name;     // General MIDI name, also the definition's name
    int lowSemitone;      // MIDI note numbers, inclusive
    int highSemitone;
    double noteDuration;  // seconds
    int level;            // the longer sample's level; the scale's loudness
};

// The parameters, pitches given by name ("C4"). OK checks them: a name, pitches that can be read
// ("Cannot interpret pitch in '%s'"), the low one not above the high one.
class DefinitionDialog : public QDialog {
    Q_OBJECT
public:
    DefinitionDialog(QWidget* parent, const QString& title);
    QLineEdit* nameEdit() const { return name; }
    QLineEdit* lowEdit() const { return low; }
    QLineEdit* highEdit() const { return high; }
    QDoubleSpinBox* durationBox() const { return duration; }
    QSpinBox* levelBox() const { return level; }
    // Valid once the dialog was accepted.
    const DefinitionParameters& parameters() const { return chosen; }

    void accept() override;

private:
    QLineEdit* name;
    QLineEdit* low;
    QLineEdit* high;
    QDoubleSpinBox* duration;
    QSpinBox* level;
    DefinitionParameters chosen{};
};

// New: the parameters, then a generated definition that becomes the current one. 1 when made.
int createDefinitionFromDialog(QWidget* parent);
// Learn (replace 0) or replace (1) from recordings the user chooses; the number learnt.
int learnDefinitionsFromDialog(QWidget* parent, int replace);
// Delete the current definition after the user's yes. 1 when deleted.
int deleteCurrentDefinition();
// The scale to record a new instrument from: the parameters, then the Save dialog proposing
// scaleMidiFileName's name. 1 when written.
int writeScaleFromDialog(QWidget* parent);
// Plays the scale file at path on the MIDI device while a box says so; Escape (or the box's
// Cancel) stops it. 1 when it played to its end, 0 when stopped or it could not play.
int playScaleFile(QWidget* parent, const std::string& path);

// The Save dialog of the scale before it runs (the tests look at it).
QFileDialog* createScaleSaveDialog(QWidget* parent, const DefinitionParameters& parameters);
// The file dialog of learning before it runs.
QFileDialog* createLearnDialog(QWidget* parent, int replace);
