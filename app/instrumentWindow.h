#pragma once
// The instrument window (class CSInst, "Cantoscope Instrument Definitions Display", 1018 x 742):
// the current instrument definition's line of text and a drawing of its learnt harmonics, with
// the commands to step through the definitions and to make (from a formula or from recordings),
// replace, delete and record them. Window > Instrument Definitions brings it up.

#include <QImage>
#include <QWidget>

class QLabel;
class QToolButton;

// The drawing: a column per semitone, frequency upwards, each harmonic a bar as strong as it is.
class InstrumentDrawing : public QWidget {
    Q_OBJECT
public:
    explicit InstrumentDrawing(QWidget* parent);
    // The current definition drawn into an image of the widget's size (tests read it).
    QImage render() const;

protected:
    void paintEvent(QPaintEvent* event) override;
};

class InstrumentWindow : public QWidget {
    Q_OBJECT
public:
    explicit InstrumentWindow(QWidget* parent);
    // The table or the current definition changed: text, drawing and buttons follow.
    void refresh();
    QLabel* textLine() const { return text; }
    InstrumentDrawing* drawing() const { return picture; }
    // 0 previous, 1 next, 2 new, 3 learn, 4 replace, 5 delete, 6 scale MIDI file.
    QToolButton* button(int which) const { return which >= 0 && which < 7 ? buttons[which] : nullptr; }
    // Makes definition index the current one (kept within the table).
    void showDefinition(int index);

private:
    QLabel* position;
    QLabel* text;
    InstrumentDrawing* picture;
    QToolButton* buttons[7] = {};
};

// The text line of the current definition, or what the window says with none.
QString instrumentWindowText();

// Brings the instrument window to the top, or creates it, owned by owner.
InstrumentWindow* showInstrumentWindow(QWidget* owner);
// The window when it exists.
InstrumentWindow* instrumentWindow();
