#pragma once
// The song's child window in the MDI area (window class WaveviewM, titled "Waveview display").
// Until the piano-roll song view is built it shows the song plainly: a line on the song and
// its note list as a table, with the selected notes marked. Asked to close, it answers with
// the song's close guard and closes the song when it goes.

#include <QWidget>

class QLabel;
class QTableWidget;

class SongWindow : public QWidget {
    Q_OBJECT
public:
    explicit SongWindow(QWidget* parent = nullptr);
    // Shows the song's current notes, selection and modes.
    void refresh();
    QTableWidget* noteTable() const { return table; }
    QLabel* summaryLabel() const { return summary; }

protected:
    void closeEvent(QCloseEvent* event) override;

private:
    QLabel* summary;
    QTableWidget* table;
};

// The chromatic name of a semitone with its octave (69 is "A4", 61 "C#/Db4").
QString semitoneName(int semitone);
