// The song view's drawing window.
#include "app/songView.h"

#include <cmath>
#include <mutex>

#include <QKeyEvent>
#include <QMouseEvent>
#include <QPainter>
#include <QScrollBar>
#include <QTimer>

#include "app/mainFrame.h"
#include "app/songViewPainter.h"
#include "analysis/pitchScale.h"
#include "audio/audioActivity.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "notes/songViewInput.h"
#include "notes/songViewKeys.h"
#include "platform/sync.h"
#include "playback/playback.h"
#include "playback/playbackState.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "store/ftBlockStore.h"
#include "shell/commandDispatch.h"
#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "store/song.h"

SongView::SongView(QWidget* parent) : QAbstractScrollArea(parent) {
    setObjectName("Waveview");
    setFrameShape(QFrame::NoFrame);
    setHorizontalScrollBarPolicy(Qt::ScrollBarAlwaysOn);
    setVerticalScrollBarPolicy(Qt::ScrollBarAlwaysOn);
    setFocusPolicy(Qt::StrongFocus);
    viewport()->setMouseTracking(true);
    viewport()->setAttribute(Qt::WA_OpaquePaintEvent);
    horizontalScrollBar()->setSingleStep(SCROLL_STEP);
    verticalScrollBar()->setSingleStep(SCROLL_STEP);
    resetSongViewGeometry();
}

SongView::~SongView() {
    resetSongViewGeometry();
    resetPointerInfo();
}

void SongView::songChanged() {
    layoutSongView(viewport()->width(), viewport()->height());
    if (audioActivity.opening) scrollToSongEnd();
    updateScrollBars();
    refreshPointerInfo();
    viewport()->update();
}

void SongView::updateScrollBars() {
    updatingScrollBars = true;
    horizontalScrollBar()->setRange(0, maxScrollX());
    horizontalScrollBar()->setPageStep(std::max(1, visiblePlotWidth()));
    horizontalScrollBar()->setValue(songViewGeometry.scrollX);
    verticalScrollBar()->setRange(0, maxScrollY());
    verticalScrollBar()->setPageStep(std::max(1, visiblePlotHeight()));
    verticalScrollBar()->setValue(songViewGeometry.scrollY);
    updatingScrollBars = false;
}

void SongView::scrollContentsBy(int, int) {
    if (updatingScrollBars) return;
    setSongViewScroll(horizontalScrollBar()->value(), verticalScrollBar()->value());
    viewport()->update();
}

void SongView::resizeEvent(QResizeEvent* event) {
    QAbstractScrollArea::resizeEvent(event);
    layoutSongView(viewport()->width(), viewport()->height());
    updateScrollBars();
}

// Detail mode draws the blocks the FT block window holds; when the visible stretch lies
// outside it, the window is moved there. Never while the worker fills it.
void SongView::loadVisibleBlocks() {
    if (displayModes.noteMode != NOTE_MODE_DETAIL || recordingOrOpeningActive() || song.blockCount == 0 ||
        song.notesOnly)
        return;
    uint32_t from = blockAtTime(std::max(0.0, xToTime(songViewGeometry.plotLeft)));
    uint32_t to = std::min(song.blockCount, blockAtTime(std::max(0.0, xToTime(viewport()->width()))) + 1);
    if (from >= ftBlockWindow.firstBlock && to <= ftBlockWindow.endBlock) return;
    if (from == failedWindowStart || ftBlockWindow.capacity == 0) return;
    if (!loadFTBlockWindow(from, to) && !(from >= ftBlockWindow.firstBlock && to <= ftBlockWindow.endBlock))
        failedWindowStart = from;
}

void SongView::paintEvent(QPaintEvent*) {
    QPainter screen(viewport());
    QSize size = viewport()->size();
    if (image.size() != size) image = QImage(size, QImage::Format_RGB32);
    // While the worker analyses, its chunk must not change the song under the painter; a
    // picture that cannot have the song now keeps the last one and tries again shortly.
    std::unique_lock<std::mutex> processing(CSWaveProcessingMutex, std::defer_lock);
    if (recordingOrOpeningActive() && !processing.try_lock()) {
        screen.drawImage(0, 0, image);
        QTimer::singleShot(30, viewport(), [this] { viewport()->update(); });
        return;
    }
    loadVisibleBlocks();
    if (!paintSongView(image)) {
        screen.fillRect(viewport()->rect(), Qt::white);
        screen.setPen(Qt::black);
        screen.drawText(8, 20, DISPLAY_PROBLEM_TEXT);
        return;
    }
    if (processing.owns_lock()) processing.unlock();
    screen.drawImage(0, 0, image);
    if (horizontalScrollBar()->maximum() != maxScrollX() || verticalScrollBar()->maximum() != maxScrollY())
        updateScrollBars();
    // Playback paused for a change of mode starts again once the new picture is on screen;
    // after this paint, so that a message it may show never opens inside one.
    if (playbackState.resumePosition != -1) QTimer::singleShot(0, this, [] { resumePlayback(); });
}

static void runFrameCommand(int id) {
    if (MainFrame* frame = mainFrame()) frame->runCommand(id);
    else dispatchCommand(id);
}

// What lies under the pointer at (x, y) of the view, as the painter draws it: the note whose
// bar holds the point, and a barline within 3 pixels.
static void trackPointer(int x, int y, int height) {
    Selection& s = selection;
    s.pointerNote = -1;
    s.pointerBarline = -1;
    if (x < songViewGeometry.plotLeft || y >= height - PLOT_BOTTOM_MARGIN) return;
    for (int i = 0; i < noteList.count && s.pointerNote < 0; i++)
        if (noteBarRect(i).adjusted(-1, -2, 1, 2).contains(QPointF(x, y))) s.pointerNote = i;
    for (int i = 0; i < barlineList.count; i++)
        if (std::abs(x - timeToX(barlineList.times[i])) <= 3) s.pointerBarline = i;
}

void SongView::mouseMoveEvent(QMouseEvent* event) {
    QPoint at = event->position().toPoint();
    trackPointer(at.x(), at.y(), viewport()->height());
    updatePointerInfo(at.x(), at.y());
    viewport()->update(QRect(0, viewport()->height() - PLOT_BOTTOM_MARGIN, viewport()->width(), PLOT_BOTTOM_MARGIN));
    QAbstractScrollArea::mouseMoveEvent(event);
}

// The virtual key of a Qt key: letters and digits are their upper-case characters.
static int virtualKeyOf(int key) {
    if ((key >= Qt::Key_A && key <= Qt::Key_Z) || (key >= Qt::Key_0 && key <= Qt::Key_9)) return key;
    if (key >= Qt::Key_F1 && key <= Qt::Key_F12) return VKEY_F1 + (key - Qt::Key_F1);
    switch (key) {
    case Qt::Key_Backspace: return VKEY_BACKSPACE;
    case Qt::Key_Tab:
    case Qt::Key_Backtab: return VKEY_TAB;
    case Qt::Key_Return:
    case Qt::Key_Enter: return VKEY_ENTER;
    case Qt::Key_Escape: return VKEY_ESCAPE;
    case Qt::Key_Space: return VKEY_SPACE;
    case Qt::Key_PageUp: return VKEY_PAGE_UP;
    case Qt::Key_PageDown: return VKEY_PAGE_DOWN;
    case Qt::Key_End: return VKEY_END;
    case Qt::Key_Home: return VKEY_HOME;
    case Qt::Key_Left: return VKEY_LEFT;
    case Qt::Key_Up: return VKEY_UP;
    case Qt::Key_Right: return VKEY_RIGHT;
    case Qt::Key_Down: return VKEY_DOWN;
    case Qt::Key_Insert: return VKEY_INSERT;
    case Qt::Key_Delete: return VKEY_DELETE;
    default: return 0;
    }
}

int songViewCodeOfKey(const QKeyEvent* event) {
    Qt::KeyboardModifiers held = event->modifiers();
    int modifiers = (held & Qt::ControlModifier ? KEY_MODIFIER_CTRL : 0) |
                    (held & Qt::ShiftModifier || event->key() == Qt::Key_Backtab ? KEY_MODIFIER_SHIFT : 0) |
                    (held & Qt::AltModifier ? KEY_MODIFIER_ALT : 0);
    return songViewKeyCode(virtualKeyOf(event->key()), modifiers);
}

bool SongView::event(QEvent* event) {
    // Tab and Shift+Tab select notes here instead of moving the focus.
    if (event->type() == QEvent::KeyPress) {
        auto* key = static_cast<QKeyEvent*>(event);
        if (key->key() == Qt::Key_Tab || key->key() == Qt::Key_Backtab) {
            keyPressEvent(key);
            return true;
        }
    }
    return QAbstractScrollArea::event(event);
}

// A left click selects notes and barlines, or places an armed paste (notes/songViewInput.h);
// playback stops first, and a note clicked alone is played.
void SongView::mousePressEvent(QMouseEvent* event) {
    if (event->button() != Qt::LeftButton || recordingOrOpeningActive()) {
        QAbstractScrollArea::mousePressEvent(event);
        return;
    }
    setFocus();
    stopPlayback();
    QPoint at = event->position().toPoint();
    trackPointer(at.x(), at.y(), viewport()->height());
    updatePointerInfo(at.x(), at.y());
    bool pasting = songViewInput.pasteArmed != 0;
    double time = xToTime(at.x());
    time = time < 0 ? -1.0 : snapTimeToBlock(time);
    int modifiers = 0;
    if (event->modifiers() & Qt::ControlModifier) modifiers |= KEY_MODIFIER_CTRL;
    if (event->modifiers() & Qt::ShiftModifier) modifiers |= KEY_MODIFIER_SHIFT;
    if (event->modifiers() & Qt::AltModifier) modifiers |= KEY_MODIFIER_ALT;
    songViewClick(time, modifiers);
    if (!pasting && modifiers == 0 && selection.pointerNote >= 0) previewNote(selection.pointerNote);
    if (MainFrame* frame = mainFrame()) {
        frame->refreshSongWindow();
        frame->refreshFrame();
    } else {
        songChanged();
    }
    event->accept();
}

void SongView::keyPressEvent(QKeyEvent* event) {
    // Playback's keys first: P plays or stops, Enter previews the selected note, and Escape
    // stops a playback before it clears anything.
    bool plain = (event->modifiers() & (Qt::ControlModifier | Qt::AltModifier | Qt::MetaModifier)) == 0;
    if ((event->key() == Qt::Key_P && plain) || event->key() == Qt::Key_Return || event->key() == Qt::Key_Enter ||
        (event->key() == Qt::Key_Escape && isPlaying())) {
        if (event->key() == Qt::Key_P) runFrameCommand(CMD_PLAY_STOP);
        else if (event->key() == Qt::Key_Escape) stopPlayback();
        else previewNote(-1);
        event->accept();
        return;
    }
    int code = songViewCodeOfKey(event);
    if (code == 0 || code == CODE_SPACE) {
        QAbstractScrollArea::keyPressEvent(event);
        return;
    }
    handleSongViewCode(code);
    // The song may have changed under every window of the frame.
    if (MainFrame* frame = mainFrame()) {
        frame->refreshSongWindow();
        frame->refreshFrame();
    } else {
        songChanged();
    }
    event->accept();
}
