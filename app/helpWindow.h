#pragma once
// The program's help: one window with a page browser that shows the help (F1, Help > Torvellan
// Melodrift Help) or the recording tips (Help > Recording Tips), both pages of the program's own
// compiled into it, and the About box.

#include <QDialog>

class QTextBrowser;

// The pages the window shows.
enum HelpPage { HELP_PAGE_HELP = 0, HELP_PAGE_RECORDING_TIPS = 1 };

class HelpWindow : public QDialog {
    Q_OBJECT
public:
    explicit HelpWindow(QWidget* parent);
    void showPage(int page);
    QTextBrowser* browser() const { return pages; }

private:
    QTextBrowser* pages;
};

// Brings the help window to the top at page, creating it the first time.
HelpWindow* showHelpWindow(QWidget* owner, int page);
// The About box: the program, its version and what it does.
void showAboutBox(QWidget* owner);
