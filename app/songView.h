#pragma once
// The song view's drawing window (class Waveview): the piano roll with both scroll bars. It
// lays itself out and paints through the engine's geometry into an off-screen image, keeps
// the scroll bars on the geometry's scroll positions, tells the pointer info where the pointer
// is and follows a song that grows while it is being opened.

#include <QAbstractScrollArea>
#include <QImage>

class QKeyEvent;

// The song view's code of a key press (notes/songViewKeys.h); 0 for a key it does not take.
int songViewCodeOfKey(const QKeyEvent* event);

class SongView : public QAbstractScrollArea {
    Q_OBJECT
public:
    explicit SongView(QWidget* parent = nullptr);
    ~SongView() override;
    // The song or the view changed: new layout and scroll ranges, repaint. While a file is
    // being opened the view scrolls so that the newest notes are visible.
    void songChanged();
    // The last picture painted (tests look at it).
    const QImage& picture() const { return image; }

protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    void scrollContentsBy(int dx, int dy) override;
    void mouseMoveEvent(QMouseEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;
    void keyPressEvent(QKeyEvent* event) override;
    bool event(QEvent* event) override;

private:
    void updateScrollBars();
    void loadVisibleBlocks();

    QImage image;
    bool updatingScrollBars = false;
    uint32_t failedWindowStart = UINT32_MAX;   // a block window that could not be loaded is not retried
};
