// The palette, style sheet and self-drawn icons. Icons are drawn on a 24-unit grid and
// rendered at the sizes the toolbar and the window manager ask for, so they stay sharp.
#include "app/appStyle.h"

#include <cmath>

#include <QApplication>
#include <QFont>
#include <QPainter>
#include <QPainterPath>
#include <QPalette>
#include <QPixmap>
#include <QProxyStyle>
#include <QStyleFactory>
#include <QToolButton>

#include "notes/displayModes.h"
#include "shell/mainFrame.h"
#include "shell/settings.h"

QColor accentColor() { return QColor(0x2f, 0x6d, 0xa8); }
QColor workspaceColor() { return QColor(0xe4, 0xe8, 0xed); }

static const QColor INK(0x26, 0x32, 0x40);        // text and icon strokes
static const QColor SURFACE(0xf5, 0xf6, 0xf8);    // windows, toolbar, status bar
static const QColor LINE(0xd3, 0xd8, 0xdf);       // borders and separators

// Fusion with the program's own message icons and without icons on dialog buttons.
class AppStyle : public QProxyStyle {
public:
    AppStyle() : QProxyStyle(QStyleFactory::create("Fusion")) {}

    int styleHint(StyleHint hint, const QStyleOption* option, const QWidget* widget,
                  QStyleHintReturn* data) const override {
        if (hint == SH_DialogButtonBox_ButtonsHaveIcons) return 0;
        return QProxyStyle::styleHint(hint, option, widget, data);
    }

    QIcon standardIcon(StandardPixmap icon, const QStyleOption* option, const QWidget* widget) const override {
        switch (icon) {
        case SP_MessageBoxInformation: return messageIcon(accentColor(), "i");
        case SP_MessageBoxCritical: return messageIcon(QColor(0xc0, 0x39, 0x2b), "\u00d7");
        case SP_MessageBoxQuestion: return messageIcon(accentColor(), "?");
        case SP_MessageBoxWarning: return messageIcon(QColor(0xd9, 0x8c, 0x1f), "!");
        default: return QProxyStyle::standardIcon(icon, option, widget);
        }
    }

private:
    // A filled disc with a white sign, drawn at the sizes message boxes use.
    static QIcon messageIcon(const QColor& color, const char* sign) {
        QIcon icon;
        for (int size : {32, 48, 64, 96}) {
            QPixmap pixmap(size, size);
            pixmap.fill(Qt::transparent);
            QPainter g(&pixmap);
            g.setRenderHint(QPainter::Antialiasing);
            g.setPen(Qt::NoPen);
            g.setBrush(color);
            g.drawEllipse(QRectF(1, 1, size - 2, size - 2));
            QFont font = g.font();
            font.setPixelSize(size * 5 / 8);
            font.setBold(true);
            g.setFont(font);
            g.setPen(Qt::white);
            g.drawText(QRect(0, 0, size, size), Qt::AlignCenter, QString::fromUtf8(sign));
            g.end();
            icon.addPixmap(pixmap);
        }
        return icon;
    }
};

void applyAppStyle(QApplication& application) {
    application.setStyle(new AppStyle);
    QPalette p;
    p.setColor(QPalette::Window, SURFACE);
    p.setColor(QPalette::WindowText, INK);
    p.setColor(QPalette::Base, Qt::white);
    p.setColor(QPalette::AlternateBase, QColor(0xf3, 0xf6, 0xfa));
    p.setColor(QPalette::Text, INK);
    p.setColor(QPalette::Button, SURFACE);
    p.setColor(QPalette::ButtonText, INK);
    p.setColor(QPalette::Highlight, accentColor());
    p.setColor(QPalette::HighlightedText, Qt::white);
    p.setColor(QPalette::ToolTipBase, QColor(0xff, 0xff, 0xf4));
    p.setColor(QPalette::ToolTipText, INK);
    p.setColor(QPalette::Light, Qt::white);
    p.setColor(QPalette::Midlight, QColor(0xe9, 0xec, 0xf0));
    p.setColor(QPalette::Mid, LINE);
    p.setColor(QPalette::Dark, QColor(0xa9, 0xb1, 0xbc));
    p.setColor(QPalette::Shadow, QColor(0x6b, 0x74, 0x80));
    p.setColor(QPalette::PlaceholderText, QColor(0x7a, 0x84, 0x90));
    p.setColor(QPalette::Disabled, QPalette::Text, QColor(0xa3, 0xab, 0xb5));
    p.setColor(QPalette::Disabled, QPalette::WindowText, QColor(0xa3, 0xab, 0xb5));
    p.setColor(QPalette::Disabled, QPalette::ButtonText, QColor(0xa3, 0xab, 0xb5));
    application.setPalette(p);

    QFont font = application.font();
    font.setPointSizeF(10.0);
    application.setFont(font);

    application.setStyleSheet(QStringLiteral(
        "QToolBar#OwnToolbar { background: #f5f6f8; border: none; border-bottom: 1px solid #d3d8df;"
        "  padding: 3px 6px; spacing: 4px; }"
        "QToolBar#OwnToolbar QToolButton { padding: 3px 8px; border: 1px solid transparent; border-radius: 5px;"
        "  color: #263240; }"
        "QToolBar#OwnToolbar QToolButton:hover { background: #e6edf5; border-color: #c9d6e4; }"
        "QToolBar#OwnToolbar QToolButton:pressed { background: #d6e3f0; }"
        "QToolBar#OwnToolbar QToolButton::menu-indicator { image: none; }"
        "QMenuBar { background: #f5f6f8; border-bottom: 1px solid #e1e5ea; }"
        "QMenuBar::item { padding: 4px 10px; background: transparent; }"
        "QMenuBar::item:selected { background: #e2eaf3; border-radius: 4px; }"
        "QMenu { background: white; border: 1px solid #cfd5dd; padding: 4px 0px; }"
        "QMenu::item { padding: 5px 28px 5px 26px; }"
        "QMenu::item:selected { background: #2f6da8; color: white; }"
        "QMenu::item:disabled { color: #a3abb5; }"
        "QMenu::item:disabled:selected { background: #eef1f4; color: #a3abb5; }"
        "QMenu::separator { height: 1px; background: #e3e7ec; margin: 4px 10px; }"
        "QStatusBar { background: #f5f6f8; border-top: 1px solid #d3d8df; }"
        "QStatusBar::item { border: none; }"
        "QStatusBar QLabel { padding: 2px 10px; color: #3c4856; }"
        "QStatusBar QLabel#statusPart2, QStatusBar QLabel#statusPart3, QStatusBar QLabel#statusPart4 {"
        "  border-left: 1px solid #d3d8df; }"
        "QHeaderView::section { background: #f1f3f6; border: none; border-bottom: 1px solid #d3d8df;"
        "  border-right: 1px solid #e3e7ec; padding: 4px 8px; color: #3c4856; }"
        "QTableWidget { border: none; gridline-color: #edf0f3; selection-background-color: #d5e4f3;"
        "  selection-color: #1d2835; }"));
}

// Strokes and shapes of each icon on the 24-unit grid.
static void paintIcon(QPainter& g, AppIcon which, const QColor& ink) {
    QPen pen(ink, 1.8, Qt::SolidLine, Qt::RoundCap, Qt::RoundJoin);
    g.setPen(pen);
    g.setBrush(Qt::NoBrush);
    switch (which) {
    case ICON_PROGRAM: {
        QLinearGradient fill(0, 0, 0, 24);
        fill.setColorAt(0, accentColor().lighter(125));
        fill.setColorAt(1, accentColor().darker(115));
        g.setPen(Qt::NoPen);
        g.setBrush(fill);
        g.drawRoundedRect(QRectF(1, 1, 22, 22), 5, 5);
        QPainterPath curve;
        curve.moveTo(4, 15);
        curve.cubicTo(7, 8, 10, 8, 12, 13);
        curve.cubicTo(14, 18, 17, 18, 20, 9);
        g.setPen(QPen(QColor(255, 255, 255, 150), 1.6, Qt::SolidLine, Qt::RoundCap));
        g.setBrush(Qt::NoBrush);
        g.drawPath(curve);
        g.setPen(Qt::NoPen);
        g.setBrush(Qt::white);
        g.drawEllipse(QPointF(9.5, 16.5), 2.6, 2.1);
        g.drawRect(QRectF(11.2, 6, 1.4, 10.5));
        g.drawRect(QRectF(11.2, 6, 5, 1.6));
        break;
    }
    case ICON_WAVE: {
        QPainterPath wave;
        wave.moveTo(2, 12);
        for (int i = 0; i <= 40; i++) {
            double x = 2 + i * 0.5;
            double envelope = 1.0 - std::abs(i - 20) / 22.0;
            wave.lineTo(x, 12 - 8 * envelope * std::sin(i * 0.9));
        }
        g.drawPath(wave);
        break;
    }
    case ICON_MIDI: {
        g.drawRoundedRect(QRectF(3, 5, 18, 14), 2, 2);
        for (double x : {9.0, 15.0}) g.drawLine(QPointF(x, 12), QPointF(x, 19));
        g.setBrush(ink);
        g.setPen(Qt::NoPen);
        for (double x : {7.5, 13.5}) g.drawRect(QRectF(x, 5, 3, 7));
        break;
    }
    case ICON_NOTE_MODE: {
        g.setBrush(ink);
        g.setPen(Qt::NoPen);
        g.drawRoundedRect(QRectF(3, 6, 9, 4), 1.5, 1.5);
        g.drawRoundedRect(QRectF(12, 14, 9, 4), 1.5, 1.5);
        break;
    }
    case ICON_DETAIL_MODE: {
        QColor faint = ink;
        faint.setAlpha(90);
        g.setBrush(faint);
        g.setPen(Qt::NoPen);
        g.drawRoundedRect(QRectF(3, 10, 18, 5), 1.5, 1.5);
        QPainterPath curve;
        curve.moveTo(3, 13);
        curve.cubicTo(6, 4, 9, 20, 12, 11);
        curve.cubicTo(15, 3, 18, 18, 21, 10);
        g.setPen(pen);
        g.setBrush(Qt::NoBrush);
        g.drawPath(curve);
        break;
    }
    case ICON_CHROMATIC:
        // Equal steps: every semitone its own line, the naturals longer.
        pen.setWidthF(1.4);
        g.setPen(pen);
        for (int i = 0; i < 5; i++) {
            double y = 4 + i * 4;
            g.drawLine(QPointF(i % 2 ? 8 : 3, y), QPointF(21, y));
        }
        break;
    case ICON_DIATONIC: {
        pen.setWidthF(1.2);
        QColor faint = ink;
        faint.setAlpha(150);
        pen.setColor(faint);
        g.setPen(pen);
        for (int i = 0; i < 5; i++) g.drawLine(QPointF(3, 5 + i * 3.5), QPointF(21, 5 + i * 3.5));
        g.setBrush(ink);
        g.setPen(Qt::NoPen);
        g.save();
        g.translate(13, 12);
        g.rotate(-20);
        g.drawEllipse(QPointF(0, 0), 3.0, 2.1);
        g.restore();
        break;
    }
    case ICON_MENU:
        for (int i = 0; i < 3; i++) g.drawLine(QPointF(5, 7 + i * 5), QPointF(19, 7 + i * 5));
        break;
    }
}

QIcon appIcon(AppIcon which) {
    QIcon icon;
    const QColor ink = which == ICON_MENU ? INK : accentColor();
    for (int size : {16, 20, 24, 32, 40, 48, 64, 128}) {
        QPixmap pixmap(size, size);
        pixmap.fill(Qt::transparent);
        QPainter g(&pixmap);
        g.setRenderHint(QPainter::Antialiasing);
        g.scale(size / 24.0, size / 24.0);
        paintIcon(g, which, ink);
        g.end();
        icon.addPixmap(pixmap);
    }
    return icon;
}

void showModeButtons(QToolButton* playback, QToolButton* note, QToolButton* layout) {
    bool wave = displayModes.playbackMode == PLAYBACK_MODE_WAVE;
    playback->setText(wave ? "Wave" : "MIDI");
    playback->setIcon(appIcon(wave ? ICON_WAVE : ICON_MIDI));
    playback->setToolTip(wave ? "Playback mode: Wave. Click for MIDI." : "Playback mode: MIDI. Click for Wave.");
    bool detail = displayModes.noteMode == NOTE_MODE_DETAIL;
    note->setText(detail ? "Detail" : "Note");
    note->setIcon(appIcon(detail ? ICON_DETAIL_MODE : ICON_NOTE_MODE));
    note->setToolTip(detail ? "Note mode: Detail. Click for Note." : "Note mode: Note. Click for Detail.");
    bool chromatic = globalSettings.scaleMode & LAYOUT_CHROMATIC;
    layout->setText(chromatic ? "Chromatic" : "Diatonic");
    layout->setIcon(appIcon(chromatic ? ICON_CHROMATIC : ICON_DIATONIC));
    layout->setToolTip(chromatic ? "Layout: Chromatic. Click for Diatonic." : "Layout: Diatonic. Click for Chromatic.");
}
