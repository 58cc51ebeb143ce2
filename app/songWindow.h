#pragma once
// The song's child window in the MDI area (window class WaveviewM, titled "Waveview display"):
// a 26-pixel toolbar with the playback mode, note mode and layout buttons and Play, the song
// view's drawing window below it, and the level meter beside it (hidden for a song of notes
// only, which has no input level). Asked to close, it answers with the song's close guard and
// closes the song when it goes.

#include <QPointer>

#include "app/levelMeter.h"
#include <QWidget>


class QToolBar;
class QToolButton;
class SongView;

class SongWindow : public QWidget {
    Q_OBJECT
public:
    explicit SongWindow(QWidget* parent = nullptr);
    ~SongWindow() override;
    // The song, its modes or the zoom changed: buttons, view and meter follow.
    void refresh();
    // The meter shows the newest level; its caption the recording source and its level.
    void refreshMeter();
    void refreshMeterCaption();
    SongView* songView() const { return view; }
    MeterWindow* meterWindow() const { return meter; }
    // 0 playback mode, 1 note mode, 2 layout, 3 Play/Stop, 4 fit to window.
    QToolButton* toolbarButton(int which) const { return which >= 0 && which < 5 ? buttons[which] : nullptr; }

protected:
    void closeEvent(QCloseEvent* event) override;
    void showEvent(QShowEvent* event) override;

private:
    void runCommand(int id);
    void showMeterForSong();

    QToolBar* toolbar;
    QToolButton* buttons[5] = {};
    SongView* view;
    QPointer<MeterWindow> meter;
    bool wasRecording = false;   // a recording ran at the last refresh
};
