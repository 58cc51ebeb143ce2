// The splash window. It is painted here rather than loaded, so it needs no image files.
#include "app/splash.h"

#include <QCoreApplication>
#include <QFont>
#include <QGuiApplication>
#include <QLinearGradient>
#include <QPainter>
#include <QPainterPath>
#include <QPixmap>
#include <QScreen>
#include <QSplashScreen>
#include <QThread>
#include <QTimer>

#include "app/appStyle.h"
#include "platform/clock.h"

static const int SPLASH_WIDTH = 475;
static const int SPLASH_HEIGHT = 386;
static const uint32_t SPLASH_WAIT = 100;       // start-up waits this long, hundredths of a second
static const int SPLASH_SHOWN_MS = 2500;      // the splash stays up at least this long

QPixmap splashPicture() {
    QPixmap pixmap(SPLASH_WIDTH, SPLASH_HEIGHT);
    QPainter g(&pixmap);
    g.setRenderHint(QPainter::Antialiasing);
    QLinearGradient fill(0, 0, 0, SPLASH_HEIGHT);
    fill.setColorAt(0, accentColor().lighter(118));
    fill.setColorAt(1, accentColor().darker(135));
    g.fillRect(pixmap.rect(), fill);

    // A melody line across the picture, like a corrected pitch curve.
    QPainterPath line;
    line.moveTo(0, 250);
    line.cubicTo(90, 180, 140, 300, 230, 240);
    line.cubicTo(320, 180, 380, 260, 475, 210);
    g.setPen(QPen(QColor(255, 255, 255, 70), 3));
    g.drawPath(line);
    g.setPen(Qt::NoPen);
    g.setBrush(QColor(255, 255, 255, 45));
    for (int i = 0; i < 6; i++) g.drawRoundedRect(QRectF(30 + i * 72, 262 - (i % 3) * 18, 56, 12), 4, 4);

    appIcon(ICON_PROGRAM).paint(&g, QRect(40, 48, 72, 72));
    g.setPen(Qt::white);
    QFont title = g.font();
    title.setPointSizeF(24);
    title.setWeight(QFont::DemiBold);
    g.setFont(title);
    g.drawText(QRect(130, 50, 330, 40), Qt::AlignLeft | Qt::AlignVCenter, "Torvellan Melodrift");
    QFont line2 = g.font();
    line2.setPointSizeF(11);
    line2.setWeight(QFont::Normal);
    g.setFont(line2);
    g.setPen(QColor(255, 255, 255, 210));
    g.drawText(QRect(132, 88, 330, 24), Qt::AlignLeft | Qt::AlignVCenter,
               "Pitch, timing and loudness for recorded melodies");
    g.drawText(QRect(40, SPLASH_HEIGHT - 44, 400, 24), Qt::AlignLeft | Qt::AlignVCenter,
               QString("Version %1  ·  Starting...").arg(MELODRIFT_VERSION));
    g.end();
    return pixmap;
}

void showSplashScreen() {
    auto* splash = new QSplashScreen(splashPicture(), Qt::WindowStaysOnTopHint);
    splash->setObjectName("Loader");
    if (QScreen* screen = QGuiApplication::primaryScreen())
        splash->move(screen->availableGeometry().center() - splash->rect().center());
    splash->show();
    QTimer::singleShot(SPLASH_SHOWN_MS, splash, [splash] {
        splash->close();
        splash->deleteLater();
    });
    uint32_t start = timeCounter();
    while (timeCounter() - start < SPLASH_WAIT) {
        QCoreApplication::processEvents(QEventLoop::AllEvents, 20);
        QThread::msleep(10);
    }
}
