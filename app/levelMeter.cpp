// The level meter window: the bars and the hint drawn by the engine's meter geometry.
#include "app/levelMeter.h"

#include <mutex>

#include <QCoreApplication>
#include <QKeyEvent>
#include <QPainter>

#include "app/mainFrame.h"
#include "audio/audioActivity.h"
#include "audio/levelMeter.h"
#include "platform/clock.h"
#include "playback/meterGeometry.h"
#include "playback/songViewGeometry.h"
#include "resources/strings.h"
#include "shell/commandTable.h"

MeterWindow::MeterWindow(QWidget* ownerWindow, QWidget* target)
    : QWidget(ownerWindow, Qt::Tool | Qt::WindowTitleHint | Qt::CustomizeWindowHint), owner(ownerWindow),
      keyTarget(target) {
    setObjectName("CSMeter");
    setWindowTitle(QString::fromStdString(resourceString(10367)));
    setAttribute(Qt::WA_OpaquePaintEvent);
    setFocusPolicy(Qt::ClickFocus);
    // Where the window system composites, the meter lets the song show through it.
    setWindowOpacity(METER_OPACITY / 255.0);
    resetMeterState(timeCounter());
    placeFromSettings();
}

void MeterWindow::placeFromSettings() {
    QRect frame = owner ? owner->frameGeometry() : QRect(0, 0, 1024, 720);
    int caption = std::max(0, frameGeometry().height() - height() - METER_FRAME);
    MeterRect r = meterWindowRect({frame.x(), frame.y(), frame.width(), frame.height()}, caption);
    resize(r.width - METER_FRAME, r.height - caption - METER_FRAME);
    move(r.x, r.y);
}

QImage MeterWindow::render() const {
    QImage image(std::max(1, width()), std::max(1, height()), QImage::Format_RGB32);
    int levels[METER_BAR_COUNT];
    {
        std::lock_guard<std::mutex> guard(levelMeter.lock);
        std::copy(levelMeter.levels, levelMeter.levels + METER_BAR_COUNT, levels);
    }
    std::lock_guard<std::mutex> drawing(songViewDrawingMutex);
    QPainter g(&image);
    int w = image.width(), h = image.height();
    g.fillRect(0, 0, w, h, QColor(METER_BACKGROUND, METER_BACKGROUND, METER_BACKGROUND));
    for (int i = 0; i < METER_BAR_COUNT; i++) {
        MeterBar bar;
        if (!meterBar(i, levels[i], w, h, &bar)) continue;
        MeterColour c = meterBarColour(levels[i]);
        g.fillRect(bar.left, bar.top, bar.width, bar.height, QColor(c.red, c.green, c.blue));
    }
    uint32_t now = timeCounter();
    meterLevelsDrawn(levels, METER_BAR_COUNT, now);
    if (meterHintShown(audioActivity.recording, now)) {
        int x, baseline, size;
        meterHintPlace(w, h, &x, &baseline, &size);
        QFont font("Arial");
        // The size is in tenths of a point, as the song view's strip fonts are.
        font.setPointSizeF(std::max(1, size) / 10.0);
        g.setFont(font);
        g.setPen(QColor(192, 192, 192));
        g.setRenderHint(QPainter::TextAntialiasing);
        g.drawText(x, baseline, QString::fromStdString(resourceString(10404)));
    }
    return image;
}

void MeterWindow::paintEvent(QPaintEvent*) {
    QPainter screen(this);
    screen.drawImage(0, 0, render());
}

void MeterWindow::resizeEvent(QResizeEvent* event) {
    QWidget::resizeEvent(event);
    int caption = std::max(0, frameGeometry().height() - height() - METER_FRAME);
    storeMeterSize(width() + METER_FRAME, height() + caption + METER_FRAME, caption);
}

// Keyboard commands keep working while the meter has the focus.
void MeterWindow::keyPressEvent(QKeyEvent* event) {
    if (keyTarget) {
        QKeyEvent copy(event->type(), event->key(), event->modifiers(), event->text(), event->isAutoRepeat(),
                       ushort(event->count()));
        QCoreApplication::sendEvent(keyTarget, &copy);
        return;
    }
    QWidget::keyPressEvent(event);
}

// A click on the hint opens the recording settings.
void MeterWindow::mousePressEvent(QMouseEvent* event) {
    if (meterHintShown(audioActivity.recording, timeCounter()) && mainFrame()) {
        mainFrame()->runCommand(CMD_RECORDING_SOURCE);
        return;
    }
    QWidget::mousePressEvent(event);
    if (keyTarget) keyTarget->setFocus();
}
