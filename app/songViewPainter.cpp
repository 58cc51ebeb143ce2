// The song view's picture. Every position comes from the engine's geometry; this file only
// chooses colours, widths and shapes. Drawing order: rows and grid, time selection, barlines,
// notes, pitch curve, play cursor, label column, info strip.
#include "app/songViewPainter.h"

#include <algorithm>
#include <cmath>
#include <mutex>

#include <QFont>
#include <QFontMetrics>
#include <QImage>
#include <QLinearGradient>
#include <QPainter>
#include <QPainterPath>

#include "analysis/pitchScale.h"
#include "audio/audioActivity.h"
#include "audio/audioActivity.h"
#include "audio/openWaveWorker.h"
#include "audio/recording.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "notes/selection.h"
#include "playback/playbackState.h"
#include "playback/pointerInfo.h"
#include "playback/songViewGeometry.h"
#include "shell/settings.h"
#include "store/ftBlockStore.h"
#include "store/song.h"

const SongViewColours& songViewColours() {
    static const SongViewColours colours = {
        QColor(0xfb, 0xfc, 0xfd),   // plot
        QColor(0xf0, 0xf3, 0xf6),   // blackKeyRow
        QColor(0xf5, 0xf6, 0xf8),   // labelColumn
        QColor(0x4a, 0x56, 0x64),   // labelText
        QColor(0xe4, 0xe8, 0xed),   // gridLine
        QColor(0xc4, 0xcc, 0xd6),   // octaveLine
        QColor(0xee, 0xf0, 0xf3),   // afterSong
        QColor(0x8a, 0x6f, 0xcf),   // barline
        QColor(0xe0, 0x7b, 0x28),   // selectedBarline
        QColor(0x2f, 0x6d, 0xa8),   // timeSelection
        48,                         // timeSelectionAlpha
        QColor(0xdc, 0xe7, 0xf2),   // timeSelectionOpaque
        QColor(0x2f, 0x6d, 0xa8),   // note
        QColor(0x5b, 0x95, 0xcc),   // noteLight
        QColor(0x1f, 0x4e, 0x7c),   // noteOutline
        QColor(0xe0, 0x7b, 0x28),   // selectedNote
        QColor(0xf2, 0xa2, 0x5c),   // selectedNoteLight
        QColor(0x9c, 0x4f, 0x12),   // selectedOutline
        QColor(0xc9, 0xdc, 0xee),   // detailNote
        QColor(0x1b, 0x5f, 0x9e),   // pitchCurve
        QColor(0xd6, 0x33, 0x33),   // playCursor
        QColor(0x26, 0x32, 0x40),   // strip
        QColor(0x3a, 0x48, 0x58),   // stripLine
        QColor(0xd8, 0xde, 0xe6),   // stripText
        QColor(0x00, 0xff, 0x00),   // stripTime
        QColor(0x3a, 0x48, 0x58),   // tuningOff
        QColor(0xf2, 0xa2, 0x5c),   // tuningOn
        QColor(0xd8, 0xde, 0xe6),   // tuningCentre
    };
    return colours;
}

double noteBarHeight() {
    const SongViewGeometry& geo = songViewGeometry;
    double spacing = (geo.scaleMode & SCALE_MODE_DIATONIC) ? diatonicPixelsPerStep() / 2 : chromaticPixelsPerSemitone();
    return std::clamp(spacing - 1, 4.0, 14.0);
}

namespace {

struct Painting {
    QPainter& g;
    const SongViewColours& c;
    int width, height;
    bool translucent, gradients;
};

QFont labelFont() {
    QFont f("Arial");
    f.setPixelSize(11);
    return f;
}

QFont stripFont(bool large) {
    QFont f("Arial");
    f.setPixelSize(large ? 18 : 12);
    return f;
}

bool isSharpOrFlat(int semitone) { return diatonicAccidental(semitone) != 0; }

// Rows, grid lines and labels of the pitch axis.
void paintGrid(Painting& p) {
    const SongViewGeometry& geo = songViewGeometry;
    int plotBottomY = std::min(p.height - PLOT_BOTTOM_MARGIN, plotBottom());
    bool chromatic = geo.scaleMode & SCALE_MODE_CHROMATIC;
    bool diatonic = geo.scaleMode & SCALE_MODE_DIATONIC;
    p.g.fillRect(0, 0, p.width, p.height - PLOT_BOTTOM_MARGIN, p.c.plot);

    // Sharp rows shaded like a keyboard's black keys, where each semitone has its own row.
    if (chromatic && !diatonic) {
        for (int k = geo.lowSemitone; k < geo.highSemitone; k++) {
            if (!isSharpOrFlat(k)) continue;
            double half = chromaticPixelsPerSemitone() / 2;
            int y = semitoneLineY(k);
            p.g.fillRect(QRectF(geo.plotLeft, y - half, p.width - geo.plotLeft, 2 * half), p.c.blackKeyRow);
        }
    }
    // The stretch beyond the song's end.
    int endX = timeToX(songDuration());
    if (endX < p.width) p.g.fillRect(std::max(endX, geo.plotLeft), 0, p.width, plotBottomY + 1, p.c.afterSong);

    double spacing = chromatic && !diatonic ? chromaticPixelsPerSemitone() : diatonicPixelsPerStep();
    p.g.setFont(labelFont());
    p.g.fillRect(0, 0, geo.plotLeft, p.height - PLOT_BOTTOM_MARGIN, p.c.labelColumn);
    p.g.setPen(p.c.octaveLine);
    p.g.drawLine(geo.plotLeft - 1, 0, geo.plotLeft - 1, p.height - PLOT_BOTTOM_MARGIN);
    for (int k = geo.lowSemitone; k <= geo.highSemitone; k++) {
        bool octave = k % 12 == 0;
        // In the Diatonic layout a sharp or flat shares its letter's line.
        if (diatonic && isSharpOrFlat(k)) continue;
        if (!diatonic && !chromatic) continue;
        int y = semitoneLineY(k);
        if (y < -20 || y > p.height) continue;
        p.g.setPen(octave ? p.c.octaveLine : p.c.gridLine);
        p.g.drawLine(geo.plotLeft, y, p.width, y);
        // Labels where they have room: every C, the other naturals from 12 pixels, sharps from 16.
        bool room = octave || (!isSharpOrFlat(k) && spacing >= 12) || spacing >= 16;
        if (!room) continue;
        QString label = QString::fromStdString(pitchName(k, octave || spacing >= 16, diatonic ? PITCH_NAMES_DIATONIC
                                                                                            : PITCH_NAMES_CHROMATIC));
        QFont font = labelFont();
        font.setBold(octave);
        p.g.setFont(font);
        p.g.setPen(octave ? p.c.labelText : p.c.labelText.lighter(135));
        p.g.drawText(QRect(4, y - 8, geo.plotLeft - 12, 16), Qt::AlignRight | Qt::AlignVCenter, label);
        p.g.setPen(octave ? p.c.octaveLine : p.c.gridLine);
        p.g.drawLine(geo.plotLeft - 6, y, geo.plotLeft - 1, y);
    }
}

void paintTimeSelection(Painting& p) {
    const Selection& s = selection;
    if (s.timeSelectionStart < 0 || s.timeSelectionEnd <= s.timeSelectionStart) return;
    int left = std::max(songViewGeometry.plotLeft, timeToX(s.timeSelectionStart));
    int right = std::min(p.width, timeToX(s.timeSelectionEnd));
    if (right <= left) return;
    int bottom = p.height - PLOT_BOTTOM_MARGIN;
    QColor fill = p.c.timeSelection;
    if (p.translucent) fill.setAlpha(p.c.timeSelectionAlpha);
    else fill = p.c.timeSelectionOpaque;
    p.g.fillRect(left, 0, right - left, bottom, fill);
    p.g.setPen(QPen(p.c.timeSelection, 1));
    if (timeToX(s.timeSelectionStart) >= songViewGeometry.plotLeft) p.g.drawLine(left, 0, left, bottom);
    if (timeToX(s.timeSelectionEnd) <= p.width) p.g.drawLine(right - 1, 0, right - 1, bottom);
}

void paintBarlines(Painting& p) {
    int bottom = p.height - PLOT_BOTTOM_MARGIN;
    for (int i = 0; i < barlineList.count; i++) {
        int x = timeToX(barlineList.times[i]);
        if (x < songViewGeometry.plotLeft || x >= p.width) continue;
        bool selected = isBarlineSelected(i) == 1;
        p.g.setPen(QPen(selected ? p.c.selectedBarline : p.c.barline, selected ? 3 : 1.5));
        p.g.drawLine(QPointF(x + 0.5, 0), QPointF(x + 0.5, bottom));
    }
}

void paintNoteBar(Painting& p, const QRectF& r, bool selected) {
    QColor base = selected ? p.c.selectedNote : p.c.note;
    QColor light = selected ? p.c.selectedNoteLight : p.c.noteLight;
    QBrush brush(base);
    if (p.gradients) {
        QLinearGradient gradient(r.topLeft(), r.bottomLeft());
        gradient.setColorAt(0, light);
        gradient.setColorAt(1, base);
        brush = QBrush(gradient);
    }
    p.g.setBrush(brush);
    p.g.setPen(QPen(selected ? p.c.selectedOutline : p.c.noteOutline, selected ? 1.5 : 1));
    double radius = std::min(3.0, r.height() / 2);
    p.g.drawRoundedRect(r, radius, radius);
}

// The notes as bars at midiNote (Note mode), or as a light band under the pitch curve (Detail).
// Notes read from a MIDI file have no pitch curve: they are bars in both modes.
void paintNotes(Painting& p) {
    bool detail = displayModes.noteMode == NOTE_MODE_DETAIL && !song.notesOnly;
    double h = noteBarHeight();
    for (int i = 0; i < noteList.count; i++) {
        QRectF r = noteBarRect(i);
        if (r.right() < songViewGeometry.plotLeft || r.left() > p.width) continue;
        bool selected = isNoteSelected(i) == 1;
        if (!detail) {
            paintNoteBar(p, r, selected);
            continue;
        }
        QColor band = selected ? p.c.selectedNoteLight : p.c.detailNote;
        if (p.translucent) band.setAlpha(selected ? 120 : 150);
        p.g.setPen(selected ? QPen(p.c.selectedOutline, 1.5) : Qt::NoPen);
        p.g.setBrush(band);
        double radius = std::min(3.0, h / 2);
        p.g.drawRoundedRect(r, radius, radius);
    }
}

// Detail mode: the detected pitch of each block held in the FT block window, as a line
// broken where a block has none.
void paintPitchCurve(Painting& p) {
    if (displayModes.noteMode != NOTE_MODE_DETAIL) return;
    const FTBlockWindow& w = ftBlockWindow;
    if (w.endBlock <= w.firstBlock || w.detectedFrequenciesBuffers.size() < w.endBlock - w.firstBlock) return;
    uint32_t first = std::max(w.firstBlock, blockAtTime(std::max(0.0, xToTime(songViewGeometry.plotLeft))));
    if (first > 0) first--;
    first = std::max(first, w.firstBlock);
    uint32_t last = std::min({w.endBlock, song.blockCount, blockAtTime(std::max(0.0, xToTime(p.width))) + 2});
    QPen pen(p.c.pitchCurve, 2);
    pen.setCapStyle(Qt::RoundCap);
    pen.setJoinStyle(Qt::RoundJoin);
    p.g.setPen(pen);
    p.g.setBrush(Qt::NoBrush);
    QPainterPath path;
    bool open = false;
    double t = songTimeOfBlock(first);
    for (uint32_t b = first; b < last; b++) {
        double d = blockDuration(b);
        const FTDetectedBuffer& detected = w.detectedFrequenciesBuffers[b - w.firstBlock];
        float f = detected.nEntries > 0 ? detected.entries[0].frequency : 0.0f;
        if (f > 0) {
            QPointF point(timeToX(t + d / 2), pitchToY(f));
            if (open) path.lineTo(point);
            else path.moveTo(point);
            open = true;
        } else {
            open = false;
        }
        t += d;
    }
    p.g.drawPath(path);
}

void paintPlayCursor(Painting& p) {
    if (!playbackRunning() || playbackState.cursor >= playbackState.end) return;
    int x = timeToX(playbackState.cursor / 100.0);
    if (x < songViewGeometry.plotLeft || x >= p.width) return;
    p.g.setPen(QPen(p.c.playCursor, 2));
    p.g.drawLine(x, 0, x, p.height - PLOT_BOTTOM_MARGIN);
}

void drawStripText(Painting& p, int x, int baseline, bool large, const QColor& colour, const QString& text) {
    p.g.setFont(stripFont(large));
    p.g.setPen(colour);
    p.g.drawText(x, baseline, text);
}

void paintInfoStrip(Painting& p) {
    int top = p.height - PLOT_BOTTOM_MARGIN;
    int baseline = p.height - INFO_BASELINE_RISE;
    p.g.fillRect(0, top, p.width, PLOT_BOTTOM_MARGIN, p.c.strip);
    p.g.setPen(p.c.stripLine);
    p.g.drawLine(0, top, p.width, top);
    const PointerInfo& info = pointerInfo;
    drawStripText(p, INFO_KIND_X, baseline, false, p.c.stripText, QString::fromStdString(info.kind));
    QString first = QString::fromStdString(info.firstTime);
    drawStripText(p, INFO_TIME_X, baseline, true, p.c.stripTime, first);
    if (!info.secondTime.empty()) {
        int x = INFO_TIME_X + QFontMetrics(stripFont(true)).horizontalAdvance(first) + INFO_SEPARATOR_GAP;
        QString separator = infoTimeSeparator();
        drawStripText(p, x, baseline, true, p.c.stripText, separator);
        x += QFontMetrics(stripFont(true)).horizontalAdvance(separator) + INFO_SEPARATOR_GAP;
        drawStripText(p, x, baseline, true, p.c.stripTime, QString::fromStdString(info.secondTime));
    }
    drawStripText(p, INFO_PITCH_X, baseline, true, p.c.stripText, QString::fromStdString(info.pitchName));
    drawStripText(p, INFO_FREQUENCY_X, baseline, false, p.c.stripText, QString::fromStdString(info.frequencyText));
    if (audioActivity.recording)
        drawStripText(p, INFO_LOAD_X, baseline, false, p.c.stripText,
                      QString::fromStdString(recordingLoadText(recordingState.processingLag,
                                                               openingProgress.processingLoad * 100.0)));

    int segments = tuningDeviationSegments(info.tuningFrequency, info.tuningKey);
    int segmentTop = top + (PLOT_BOTTOM_MARGIN - TUNING_SEGMENT_HEIGHT) / 2;
    for (int i = 0; i < TUNING_SEGMENTS; i++)
        p.g.fillRect(tuningSegmentLeft(i), segmentTop, TUNING_SEGMENT_WIDTH, TUNING_SEGMENT_HEIGHT,
                     tuningSegmentLit(i, segments) ? p.c.tuningOn : p.c.tuningOff);
    p.g.fillRect(TUNING_CENTRE_X, top + (PLOT_BOTTOM_MARGIN - TUNING_CENTRE_HEIGHT) / 2, TUNING_CENTRE_WIDTH,
                 TUNING_CENTRE_HEIGHT, p.c.tuningCentre);
}

}  // namespace

QRectF noteBarRect(int index) {
    const Note& n = noteList.notes[index];
    bool wave = displayModes.playbackMode == PLAYBACK_MODE_WAVE;
    int x0 = timeToX(wave ? n.waveStart : n.midiStart), x1 = timeToX(wave ? n.waveEnd : n.midiEnd);
    double h = noteBarHeight();
    double y = pitchToY(pitchToFrequency(n.midiNote));
    return QRectF(x0 + 0.5, y - h / 2, std::max(2, x1 - x0 - 1), h);
}

int paintSongView(QImage& image) {
    if (image.isNull()) return 0;
    QPainter g(&image);
    if (!g.isActive()) return 0;
    layoutSongView(image.width(), image.height());
    std::lock_guard<std::mutex> guard(songViewDrawingMutex);
    Painting p{g, songViewColours(), image.width(), image.height(), generalSettings.drawTransparencies,
               generalSettings.drawGradients};
    g.setRenderHint(QPainter::Antialiasing, generalSettings.drawSmoothLines);
    g.setRenderHint(QPainter::TextAntialiasing, true);
    paintGrid(p);
    // The plot area proper: the label column stays clear of everything drawn over time.
    g.save();
    g.setClipRect(songViewGeometry.plotLeft, 0, p.width - songViewGeometry.plotLeft, p.height - PLOT_BOTTOM_MARGIN);
    paintTimeSelection(p);
    paintBarlines(p);
    paintNotes(p);
    paintPitchCurve(p);
    paintPlayCursor(p);
    g.restore();
    paintInfoStrip(p);
    return 1;
}
