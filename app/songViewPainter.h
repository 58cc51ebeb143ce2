#pragma once
// Paints the song view's drawing window into an image: the pitch grid with its labels, the
// barlines, the time selection, the notes (bars in Note mode, the detected pitch curve in
// Detail mode), the selection marks, the play cursor and the info strip, all placed by the
// engine's song view geometry. The song view widget and the Qt tests call it.

#include <QColor>
#include <QRectF>

class QImage;

// The view's colours: a light plot matching the program, under a dark info strip whose
// green times stay readable.
struct SongViewColours {
    QColor plot;            // background of natural-note rows
    QColor blackKeyRow;     // background of sharp/flat rows (Chromatic layout)
    QColor labelColumn;     // the pitch label column
    QColor labelText;
    QColor gridLine;        // semitone and staff lines
    QColor octaveLine;      // the C lines
    QColor afterSong;       // beyond the song's end
    QColor barline;
    QColor selectedBarline;
    QColor timeSelection;   // drawn at timeSelectionAlpha when translucent fills are on
    int timeSelectionAlpha;
    QColor timeSelectionOpaque;   // its fill when translucent fills are off
    QColor note;
    QColor noteLight;       // the top of a note's gradient
    QColor noteOutline;
    QColor selectedNote;
    QColor selectedNoteLight;
    QColor selectedOutline;
    QColor detailNote;      // a note's span under the pitch curve (Detail mode)
    QColor pitchCurve;
    QColor playCursor;
    QColor strip;           // the info strip's background
    QColor stripLine;       // its top edge
    QColor stripText;
    QColor stripTime;       // the times, green
    QColor tuningOff;
    QColor tuningOn;
    QColor tuningCentre;
};
const SongViewColours& songViewColours();

// The height of a note bar in pixels at the present layout and zoom: the painter draws the
// bars with it and the view finds the note under the pointer with it.
double noteBarHeight();

// Lays the view out for the image's size and paints the whole drawing window into image,
// under the drawing lock. The drawing settings switch anti-aliasing, translucent fills and
// gradients. 0 when the image cannot be painted on (the caller shows the display problem).
int paintSongView(QImage& image);

// Where note index is drawn: a bar at its key over its time span (the wave span in Wave mode,
// the MIDI span in MIDI mode), in drawing window pixels. Clicks on a note hit this rectangle.
QRectF noteBarRect(int index);

// The text shown instead of the picture when it cannot be painted.
constexpr const char* DISPLAY_PROBLEM_TEXT = "DISPLAY PROBLEM: Cannot select bitmap object into current DC.";
