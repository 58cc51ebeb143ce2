#pragma once
// The level meter (class CSMeter, "Recording Level"): a small translucent tool window beside
// the song view showing the newest input levels as 32 bars and, while recording, a hint when
// the level stays low. Placed and sized from its settings, its size kept back for the next
// start; keys go on to the song view. Opening and recording feed its levels.

#include <QImage>
#include <QWidget>

class MeterWindow : public QWidget {
    Q_OBJECT
public:
    // owner: the window it belongs to (placed against it); keys go to keyTarget.
    MeterWindow(QWidget* owner, QWidget* keyTarget);
    // Moves and sizes the window from the settings against the owner.
    void placeFromSettings();
    // Paints the meter into an image of the client size (tests read it).
    QImage render() const;
    void setKeyTarget(QWidget* target) { keyTarget = target; }

protected:
    void paintEvent(QPaintEvent* event) override;
    void resizeEvent(QResizeEvent* event) override;
    void keyPressEvent(QKeyEvent* event) override;
    void mousePressEvent(QMouseEvent* event) override;

private:
    QWidget* owner;
    QWidget* keyTarget;
};
