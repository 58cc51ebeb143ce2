#pragma once
// Shared by the desktop program's Qt tests: emptying the engine's state between tests, a song
// with notes built in a line, and answering the next modal box as a user would.

#include <QAbstractButton>
#include <QApplication>
#include <QMessageBox>
#include <QString>
#include <QTimer>
#include <QWidget>

#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "platform/clock.h"
#include "platform/mainloop.h"
#include "platform/ui.h"
#include "shell/appTimers.h"
#include "shell/commandDispatch.h"
#include "shell/mainFrame.h"
#include "shell/openQueue.h"
#include "shell/saveSong.h"
#include "shell/settings.h"
#include "shell/zoom.h"
#include "store/song.h"

inline void resetEngineState() {
    resetFrameState();
    resetZoom();
    resetAppTimers();
    resetOpenQueue();
    resetMainLoop();
    commandOperations = CommandOperations{};
    resetSongNames();
    resetNoteList();
    resetSelection();
    resetSong();
    resetDisplayModes();
    audioActivity = AudioActivity{};
    globalSettings = GlobalSettings{};
    clearUiCalls();
}

// Gives the song blocks blocks of 1/128 s and notes notes of 0.25 s, one after another.
inline void makeSong(uint32_t blocks, int notes) {
    song.sampleBlockDuration = 1.0 / 128;
    song.sampleBlockDurations.assign(blocks, 1.0 / 128);
    song.blockCount = blocks;
    song.waveFormat = SongWaveFormat{1, 1, 44100, 88200, 2, 16};
    for (int i = 0; i < notes; i++) {
        Note note{};
        note.midiNote = uint8_t(60 + i % 12);
        note.pitch = 261.63f;
        note.midiStart = note.waveStart = 0.25f * float(i);
        note.midiEnd = note.waveEnd = 0.25f * float(i) + 0.25f;
        note.volumeSum = 1000;
        appendNote(note);
    }
}

// What the user saw in the box answered by answerNextBox.
struct SeenBox {
    QString title;
    QString text;
    QMessageBox::Icon icon = QMessageBox::NoIcon;
    bool seen = false;
};

// Once the next modal message box is up, records it into *seen and presses button.
inline void answerNextBox(SeenBox* seen, QMessageBox::StandardButton button) {
    auto* poll = new QTimer;
    QObject::connect(poll, &QTimer::timeout, [poll, seen, button] {
        auto* box = qobject_cast<QMessageBox*>(QApplication::activeModalWidget());
        if (!box) return;
        poll->stop();
        poll->deleteLater();
        seen->title = box->windowTitle();
        seen->text = box->text();
        seen->icon = box->icon();
        seen->seen = true;
        box->button(button)->click();
    });
    poll->start(10);
}
