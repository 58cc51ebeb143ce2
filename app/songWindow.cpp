// The stand-in song window: the song's notes as a table.
#include "app/songWindow.h"

#include <QCloseEvent>
#include <QHeaderView>
#include <QLabel>
#include <QTableWidget>
#include <QVBoxLayout>

#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "shell/mainFrame.h"
#include "store/song.h"

QString semitoneName(int semitone) {
    static const char* const names[12] = {"C", "C#/Db", "D", "D#/Eb", "E", "F", "F#/Gb", "G", "G#/Ab", "A", "A#/Bb", "B"};
    if (semitone < 0) return QString();
    return QString("%1%2").arg(names[semitone % 12]).arg(semitone / 12 - 1);
}

SongWindow::SongWindow(QWidget* parent) : QWidget(parent) {
    setObjectName("Waveview");
    auto* layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);

    summary = new QLabel(this);
    summary->setObjectName("songSummary");
    summary->setContentsMargins(12, 8, 12, 8);
    summary->setStyleSheet("QLabel#songSummary { background: #f7f9fb; border-bottom: 1px solid #e1e5ea;"
                           " color: #3c4856; }");
    layout->addWidget(summary);

    table = new QTableWidget(0, 6, this);
    table->setObjectName("noteTable");
    table->setHorizontalHeaderLabels({"Note", "Pitch", "Frequency (Hz)", "Start (s)", "End (s)", "Volume"});
    table->verticalHeader()->setVisible(false);
    table->setEditTriggers(QAbstractItemView::NoEditTriggers);
    table->setSelectionMode(QAbstractItemView::NoSelection);
    table->setFocusPolicy(Qt::NoFocus);
    table->setAlternatingRowColors(true);
    table->horizontalHeader()->setSectionResizeMode(QHeaderView::Stretch);
    table->horizontalHeader()->setDefaultAlignment(Qt::AlignLeft | Qt::AlignVCenter);
    layout->addWidget(table, 1);
    refresh();
}

void SongWindow::refresh() {
    QString modes = QString("%1 mode, %2 mode")
                        .arg(displayModes.playbackMode == PLAYBACK_MODE_WAVE ? "Wave" : "MIDI")
                        .arg(displayModes.noteMode == NOTE_MODE_DETAIL ? "Detail" : "Note");
    QString audio = song.blockCount == 0
                        ? QString("no audio")
                        : QString("%1 s of audio at %2 Hz, %3-bit")
                              .arg(songDuration(), 0, 'f', 2)
                              .arg(song.waveFormat.samplesPerSec)
                              .arg(song.waveFormat.bitsPerSample);
    summary->setText(QString("<b>%1 notes</b> &nbsp;·&nbsp; %2 &nbsp;·&nbsp; %3 selected &nbsp;·&nbsp; %4"
                             "<br><span style='color:#7a8490'>Note list of the song. The piano-roll song view "
                             "is not available in this version.</span>")
                         .arg(noteList.count)
                         .arg(audio)
                         .arg(selection.selectedNoteCount)
                         .arg(modes));

    table->setRowCount(noteList.count);
    QColor selectedColor(0xd5, 0xe4, 0xf3);
    for (int i = 0; i < noteList.count; i++) {
        const Note& n = noteList.notes[i];
        bool note = displayModes.playbackMode == PLAYBACK_MODE_MIDI;
        const QString cells[6] = {QString::number(i + 1),
                                  semitoneName(n.midiNote),
                                  QString::number(n.pitch, 'f', 1),
                                  QString::number(note ? n.midiStart : n.waveStart, 'f', 3),
                                  QString::number(note ? n.midiEnd : n.waveEnd, 'f', 3),
                                  QString::number(n.volumeSum)};
        bool selected = isNoteSelected(i) == 1;
        for (int c = 0; c < 6; c++) {
            auto* item = new QTableWidgetItem(cells[c]);
            if (selected) item->setBackground(selectedColor);
            table->setItem(i, c, item);
        }
    }
}

void SongWindow::closeEvent(QCloseEvent* event) {
    if (!songWindowMayClose()) {
        event->ignore();
        return;
    }
    event->accept();
    songWindowClosed();
}
