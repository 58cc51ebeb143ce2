// The instrument window. Positions come from the engine's instrument view geometry; this file
// chooses colours and shapes and wires the buttons to the commands of the instrument dialogs.
#include "app/instrumentWindow.h"

#include <algorithm>
#include <cmath>

#include <QHBoxLayout>
#include <QLabel>
#include <QPainter>
#include <QPointer>
#include <QToolButton>
#include <QVBoxLayout>

#include "analysis/instrumentDefinitions.h"
#include "analysis/pitchScale.h"
#include "app/appStyle.h"
#include "app/instrumentDialogs.h"
#include "playback/instrumentView.h"
#include "playback/songViewGeometry.h"

static QPointer<InstrumentWindow> theWindow;

static const InstrumentDefinition* currentDefinition() {
    const InstrumentDefinitions& t = instrumentDefinitions;
    if (t.current < 0 || t.current >= int(t.definitions.size())) return nullptr;
    return &t.definitions[size_t(t.current)];
}

QString instrumentWindowText() {
    const InstrumentDefinition* d = currentDefinition();
    if (!d) return "No instrument definitions are loaded. Make one with New, or learn one from a recording with Learn.";
    return QString::fromStdString(instrumentDefinitionText(*d));
}

// ---- the drawing ----

InstrumentDrawing::InstrumentDrawing(QWidget* parent) : QWidget(parent) {
    setObjectName("instrumentDrawing");
    setAttribute(Qt::WA_OpaquePaintEvent);
    setMinimumSize(320, 200);
}

QImage InstrumentDrawing::render() const {
    QImage image(std::max(1, width()), std::max(1, height()), QImage::Format_RGB32);
    QPainter g(&image);
    g.fillRect(image.rect(), QColor(0xfb, 0xfc, 0xfd));
    const InstrumentDefinition* d = currentDefinition();
    if (!d) return image;
    g.setRenderHint(QPainter::Antialiasing);
    InstrumentViewLayout layout = layoutInstrumentView(*d, image.width(), image.height());
    QRectF plot(layout.left, layout.top, layout.width, layout.height);
    QFont small = font();
    small.setPixelSize(11);
    g.setFont(small);

    // Octaves of A across the plot, labelled with their frequency.
    for (double f = layout.lowFrequency; f <= layout.highFrequency * 1.001; f *= 2) {
        double y = instrumentFrequencyY(layout, f);
        g.setPen(QColor(0xd6, 0xdc, 0xe3));
        g.drawLine(QPointF(plot.left(), y), QPointF(plot.right(), y));
        g.setPen(QColor(0x4a, 0x56, 0x64));
        g.drawText(QRectF(0, y - 8, layout.left - 6, 16), Qt::AlignRight | Qt::AlignVCenter,
                   QString("%1 Hz").arg(f, 0, 'f', f < 100 ? 1 : 0));
    }
    // A column per semitone: a line at each C, the note's own pitch as a faint guide.
    bool roomForAll = layout.columnWidth >= 28;
    for (int c = 0; c < layout.columns; c++) {
        int semitone = d->lowSemitone + c;
        double x = layout.left + c * layout.columnWidth;
        bool octave = semitone % 12 == 0;
        g.setPen(octave ? QColor(0xc4, 0xcc, 0xd6) : QColor(0xee, 0xf0, 0xf3));
        g.drawLine(QPointF(x, plot.top()), QPointF(x, plot.bottom()));
        double y = instrumentFrequencyY(layout, pitchToFrequency(semitone));
        g.setPen(QPen(QColor(0xc9, 0xdc, 0xee), 1, Qt::DashLine));
        g.drawLine(QPointF(x + 1, y), QPointF(x + layout.columnWidth - 1, y));
        if (roomForAll || octave || c == 0 || c == layout.columns - 1) {
            g.setPen(QColor(0x4a, 0x56, 0x64));
            g.drawText(QRectF(x - 20, plot.bottom() + 4, layout.columnWidth + 40, 16), Qt::AlignHCenter | Qt::AlignTop,
                       QString::fromStdString(pitchName(semitone, true, PITCH_NAMES_DIATONIC)));
        }
    }
    g.setPen(QColor(0xc4, 0xcc, 0xd6));
    g.setBrush(Qt::NoBrush);
    g.drawRect(plot);

    // The harmonics: stronger ones darker and thicker.
    QColor accent = accentColor();
    for (const HarmonicMark& mark : harmonicMarks(*d, layout)) {
        double strength = std::clamp(mark.strength, 0.0, 1.0);
        QColor colour = accent;
        colour.setAlphaF(0.2 + 0.8 * strength);
        double thickness = 1.5 + 3.5 * strength;
        g.fillRect(QRectF(mark.x0, mark.y - thickness / 2, std::max(1.0, mark.x1 - mark.x0), thickness), colour);
    }
    return image;
}

void InstrumentDrawing::paintEvent(QPaintEvent*) {
    QPainter screen(this);
    screen.drawImage(0, 0, render());
}

// ---- the window ----

InstrumentWindow::InstrumentWindow(QWidget* parent) : QWidget(parent, Qt::Window) {
    setObjectName("CSInst");
    setWindowTitle("Cantoscope Instrument Definitions Display");
    setWindowIcon(appIcon(ICON_PROGRAM));
    resize(1018, 742);

    auto* bar = new QHBoxLayout;
    const char* labels[7] = {"◀ Previous", "Next ▶", "New...", "Learn...", "Replace...", "Delete", "Scale MIDI File..."};
    const char* tips[7] = {"Show the previous definition", "Show the next definition",
                           "Make a definition from a formula for a General MIDI instrument",
                           "Learn a definition from recordings of its notes",
                           "Replace learnt notes from recordings of single notes",
                           "Delete the definition shown", "Save a chromatic scale to record a new instrument from"};
    for (int i = 0; i < 7; i++) {
        buttons[i] = new QToolButton(this);
        buttons[i]->setText(labels[i]);
        buttons[i]->setToolTip(tips[i]);
        buttons[i]->setAutoRaise(true);
        bar->addWidget(buttons[i]);
        if (i == 1 || i == 4) bar->addSpacing(12);
    }
    bar->addStretch(1);
    position = new QLabel(this);
    bar->addWidget(position);

    text = new QLabel(this);
    text->setObjectName("instrumentText");
    text->setWordWrap(true);
    text->setTextInteractionFlags(Qt::TextSelectableByMouse);
    picture = new InstrumentDrawing(this);

    auto* layout = new QVBoxLayout(this);
    layout->addLayout(bar);
    layout->addWidget(text);
    layout->addWidget(picture, 1);

    connect(buttons[0], &QToolButton::clicked, this, [this] { showDefinition(instrumentDefinitions.current - 1); });
    connect(buttons[1], &QToolButton::clicked, this, [this] { showDefinition(instrumentDefinitions.current + 1); });
    // A new or learnt definition becomes the current one, so the window shows it.
    connect(buttons[2], &QToolButton::clicked, this, [this] {
        createDefinitionFromDialog(this);
        refresh();
    });
    connect(buttons[3], &QToolButton::clicked, this, [this] {
        learnDefinitionsFromDialog(this, 0);
        refresh();
    });
    connect(buttons[4], &QToolButton::clicked, this, [this] {
        learnDefinitionsFromDialog(this, 1);
        refresh();
    });
    connect(buttons[5], &QToolButton::clicked, this, [this] {
        deleteCurrentDefinition();
        refresh();
    });
    connect(buttons[6], &QToolButton::clicked, this, [this] { writeScaleFromDialog(this); });
    refresh();
}

void InstrumentWindow::showDefinition(int index) {
    int count = int(instrumentDefinitions.definitions.size());
    instrumentDefinitions.current = std::clamp(index, 0, std::max(0, count - 1));
    refresh();
}

void InstrumentWindow::refresh() {
    int count = int(instrumentDefinitions.definitions.size());
    int current = instrumentDefinitions.current;
    text->setText(instrumentWindowText());
    position->setText(count ? QString("%1 of %2").arg(current + 1).arg(count) : QString());
    buttons[0]->setEnabled(count > 0 && current > 0);
    buttons[1]->setEnabled(current + 1 < count);
    buttons[4]->setEnabled(count > 0);
    buttons[5]->setEnabled(count > 0);
    picture->update();
}

InstrumentWindow* showInstrumentWindow(QWidget* owner) {
    if (!theWindow) theWindow = new InstrumentWindow(owner);
    theWindow->refresh();
    theWindow->show();
    theWindow->raise();
    theWindow->activateWindow();
    return theWindow;
}

InstrumentWindow* instrumentWindow() { return theWindow; }
