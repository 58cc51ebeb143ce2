#pragma once
// The Open and Save dialogs. Open offers "Wave audio files" and "MIDI files" and takes many
// files; Save offers
// the one filter of the current output type, proposes the song's remembered name and carries
// the "&Only save selected range" check box. Both start in their stored folder and filter and
// store them back after OK.

#include <QStringList>

class QFileDialog;
class QWidget;

// The dialogs before they run (the tests look at them).
QFileDialog* createOpenDialog(QWidget* parent);
QFileDialog* createSaveDialog(QWidget* parent);

// Runs the Open dialog: the chosen files (empty when cancelled).
QStringList runOpenDialog(QWidget* parent);
// Runs the Save dialog: the chosen name (empty when cancelled); the check box's state is
// kept in frameState.onlySaveSelectedRange.
QString runSaveDialog(QWidget* parent);
