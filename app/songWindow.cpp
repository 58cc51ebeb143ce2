// The song window: toolbar, song view and level meter.
#include "app/songWindow.h"

#include <QCloseEvent>
#include <QToolBar>
#include <QToolButton>
#include <QVBoxLayout>

#include "app/appStyle.h"
#include "app/levelMeter.h"
#include "app/mainFrame.h"
#include "app/songView.h"
#include "audio/audioActivity.h"
#include "audio/recordingSource.h"
#include "notes/displayModes.h"
#include "playback/playback.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "shell/commandDispatch.h"
#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "shell/settings.h"
#include "store/song.h"

SongWindow::SongWindow(QWidget* parent) : QWidget(parent) {
    setObjectName("songWindow");
    auto* layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);

    toolbar = new QToolBar(this);
    toolbar->setObjectName("OwnToolbar");
    toolbar->setFixedHeight(SONG_VIEW_TOOLBAR_HEIGHT);
    toolbar->setIconSize(QSize(16, 16));
    toolbar->setToolButtonStyle(Qt::ToolButtonTextBesideIcon);
    const char* names[5] = {"playbackModeButton", "noteModeButton", "layoutButton", "playButton", "fitButton"};
    for (int i = 0; i < 5; i++) {
        buttons[i] = new QToolButton(toolbar);
        buttons[i]->setObjectName(names[i]);
        buttons[i]->setAutoRaise(true);
        buttons[i]->setToolButtonStyle(Qt::ToolButtonTextBesideIcon);
        if (i == 3) toolbar->addSeparator();
        toolbar->addWidget(buttons[i]);
    }
    buttons[4]->setText("Fit");
    buttons[4]->setToolTip("Zoom so that the whole song fits the window");
    connect(buttons[0], &QToolButton::clicked, this, [this] {
        runCommand(displayModes.playbackMode == PLAYBACK_MODE_WAVE ? CMD_MIDI_MODE : CMD_WAVE_MODE);
    });
    connect(buttons[1], &QToolButton::clicked, this, [this] {
        runCommand(displayModes.noteMode == NOTE_MODE_DETAIL ? CMD_NOTE_MODE : CMD_DETAIL_MODE);
    });
    connect(buttons[2], &QToolButton::clicked, this, [this] {
        runCommand(globalSettings.scaleMode & LAYOUT_CHROMATIC ? CMD_DIATONIC : CMD_CHROMATIC);
    });
    connect(buttons[3], &QToolButton::clicked, this, [this] { runCommand(CMD_PLAY_STOP); });
    connect(buttons[4], &QToolButton::clicked, this, [this] {
        if (fitZoomToWindow()) {
            updateFrameDisplay();
            refresh();
        }
    });
    layout->addWidget(toolbar);

    view = new SongView(this);
    layout->addWidget(view, 1);
    setFocusProxy(view);
    refresh();
}

SongWindow::~SongWindow() {
    if (meter) delete meter.data();
}

void SongWindow::runCommand(int id) {
    if (MainFrame* frame = mainFrame()) frame->runCommand(id);
    else dispatchCommand(id);
    refresh();
}

void SongWindow::showEvent(QShowEvent* event) {
    QWidget::showEvent(event);
    // The meter is a tool window of the frame, created with the view the first time it shows.
    if (!meter) {
        meter = new MeterWindow(window(), view);
        showMeterForSong();
    }
}

// A song of notes read from a MIDI file has no input whose level the meter could show.
void SongWindow::showMeterForSong() {
    bool wanted = !song.notesOnly;
    if (meter && isVisible() && meter->isVisible() != wanted) meter->setVisible(wanted);
}

void SongWindow::refresh() {
    showModeButtons(buttons[0], buttons[1], buttons[2]);
    buttons[3]->setText(playButtonLabel());
    view->songChanged();
    showMeterForSong();
    // A recording that starts names its source and level on the meter.
    if (audioActivity.recording && !wasRecording) refreshMeterCaption();
    wasRecording = audioActivity.recording;
    if (meter) meter->update();
}

void SongWindow::refreshMeter() {
    if (meter) meter->update();
}

void SongWindow::refreshMeterCaption() {
    if (meter && meter->isVisible()) meter->setWindowTitle(QString::fromStdString(meterLevelText()));
}

void SongWindow::closeEvent(QCloseEvent* event) {
    if (!songWindowMayClose()) {
        event->ignore();
        return;
    }
    event->accept();
    if (meter) meter->hide();
    songWindowClosed();
}
