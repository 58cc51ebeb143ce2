// The help window. The pages are HTML compiled into the program (app/help/), so the help is there
// wherever the program runs; links between and within them stay in the window.
#include "app/helpWindow.h"

#include <QDialogButtonBox>
#include <QMessageBox>
#include <QPointer>
#include <QPushButton>
#include <QTextBrowser>
#include <QVBoxLayout>

#include "app/appStyle.h"
#include "resources/strings.h"

static QPointer<HelpWindow> theWindow;

static const char* const PAGE_SOURCES[] = {"qrc:/help/help.html", "qrc:/help/recording-tips.html"};

HelpWindow::HelpWindow(QWidget* parent) : QDialog(parent, Qt::Window) {
    setObjectName("helpWindow");
    setWindowIcon(appIcon(ICON_PROGRAM));
    resize(760, 640);
    pages = new QTextBrowser(this);
    pages->setObjectName("helpPages");
    pages->setOpenExternalLinks(true);
    auto* buttons = new QDialogButtonBox(this);
    QPushButton* back = buttons->addButton("Back", QDialogButtonBox::ActionRole);
    QPushButton* contents = buttons->addButton("Help", QDialogButtonBox::ActionRole);
    QPushButton* tips = buttons->addButton("Recording Tips", QDialogButtonBox::ActionRole);
    buttons->addButton(QDialogButtonBox::Close);
    connect(back, &QPushButton::clicked, pages, &QTextBrowser::backward);
    connect(pages, &QTextBrowser::backwardAvailable, back, &QPushButton::setEnabled);
    back->setEnabled(false);
    connect(contents, &QPushButton::clicked, this, [this] { showPage(HELP_PAGE_HELP); });
    connect(tips, &QPushButton::clicked, this, [this] { showPage(HELP_PAGE_RECORDING_TIPS); });
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::close);
    connect(pages, &QTextBrowser::sourceChanged, this, [this] { setWindowTitle(pages->documentTitle()); });
    auto* layout = new QVBoxLayout(this);
    layout->addWidget(pages, 1);
    layout->addWidget(buttons);
}

void HelpWindow::showPage(int page) {
    if (page < HELP_PAGE_HELP || page > HELP_PAGE_RECORDING_TIPS) page = HELP_PAGE_HELP;
    pages->setSource(QUrl(PAGE_SOURCES[page]));
}

HelpWindow* showHelpWindow(QWidget* owner, int page) {
    if (!theWindow) theWindow = new HelpWindow(owner);
    theWindow->showPage(page);
    theWindow->show();
    theWindow->raise();
    theWindow->activateWindow();
    return theWindow;
}

void showAboutBox(QWidget* owner) {
    QMessageBox box(QMessageBox::NoIcon, "About Torvellan Melodrift",
                    QString("<h3>Torvellan Melodrift</h3><p>Version %1</p>"
                            "<p>Corrects the pitch, timing and loudness of a recorded melody: it finds the "
                            "notes of a singing voice or an instrument, lets you put them right, and "
                            "rebuilds the sound under every note you change.</p>"
                            "<p>Opens wave and MIDI files; saves wave and MIDI files.</p>"
                            "<p style='color:#7a8490'>%2. Built with Qt %3.</p>")
                        .arg(MELODRIFT_VERSION, QString::fromStdString(resourceString(10271)), qVersion()),
                    QMessageBox::Ok, owner);
    box.setObjectName("aboutBox");
    box.setTextFormat(Qt::RichText);
    box.setIconPixmap(appIcon(ICON_PROGRAM).pixmap(64, 64));
    box.exec();
}
