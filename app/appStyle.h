#pragma once
// The desktop program's look: one calm palette and style for every window, and the icons
// it draws itself (the program's icon 184, the toolbar's mode and menu buttons).

#include <QColor>
#include <QIcon>

class QApplication;
class QToolButton;

// The palette's accent and the MDI area's background.
QColor accentColor();
QColor workspaceColor();

// Sets the style, palette, font and style sheet of the whole program.
void applyAppStyle(QApplication& application);

// Icons drawn with QPainter.
enum AppIcon {
    ICON_PROGRAM,       // icon 184: the frame and the song window
    ICON_WAVE,          // playback mode Wave
    ICON_MIDI,          // playback mode MIDI
    ICON_NOTE_MODE,     // note mode Note
    ICON_DETAIL_MODE,   // note mode Detail
    ICON_CHROMATIC,     // layout Chromatic
    ICON_DIATONIC,      // layout Diatonic
    ICON_MENU           // the button that opens the popup menu
};
QIcon appIcon(AppIcon which);

// The three mode buttons of the frame's and the song window's toolbars show the playback
// mode, the note mode and the layout in force, with a tip saying what a click does.
void showModeButtons(QToolButton* playback, QToolButton* note, QToolButton* layout);
