// The main frame. Menu items show their keys but do not take them: the keys are the
// accelerator table's, always live, so a greyed command may still arrive by key and its
// guard in the dispatch decides, as the menus' rules only decide what the menus offer.
#include "app/mainFrame.h"

#include <QApplication>
#include <QCloseEvent>
#include <QGuiApplication>
#include <QLabel>
#include <QMdiArea>
#include <QMdiSubWindow>
#include <QMenuBar>
#include <QPainter>
#include <QScreen>
#include <QSessionManager>
#include <QStatusBar>
#include <QThread>
#include <QTimer>
#include <QToolBar>
#include <QToolButton>

#include "app/appStyle.h"
#include "app/fileDialogs.h"
#include "app/helpWindow.h"
#include "app/instrumentWindow.h"
#include "app/preferencesDialog.h"
#include "app/speedWarningDialog.h"
#include "app/songWindow.h"
#include "audio/audioActivity.h"
#include "audio/openWaveFile.h"
#include "audio/recording.h"
#include "audio/recordingSource.h"
#include "notes/displayModes.h"
#include "notes/noteList.h"
#include "platform/mainloop.h"
#include "platform/qt/qtUi.h"
#include "platform/ui.h"
#include "shell/commandDispatch.h"
#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "shell/menuEnabling.h"
#include "shell/openQueue.h"
#include "shell/saveSong.h"
#include "shell/settings.h"
#include "shell/zoom.h"
#include "store/song.h"

static MainFrame* theFrame = nullptr;

MainFrame* mainFrame() { return theFrame; }

// The engine may ask from a worker thread; windows are touched on the user interface thread.
template <class Call> static void onUiThread(Call call) {
    if (!theFrame) return;
    if (QThread::currentThread() == qApp->thread()) call();
    else QMetaObject::invokeMethod(theFrame, call, Qt::QueuedConnection);
}

static const FrameWindowFunctions frameWindowFunctions = {
    [] { onUiThread([] { if (theFrame) theFrame->showSongWindow(); }); },
    [] { onUiThread([] { if (theFrame) theFrame->refreshSongWindow(); }); },
    [](const std::string& text) {
        QString tip = QString::fromStdString(text);
        onUiThread([tip] { if (theFrame) theFrame->showTip(tip); });
    },
    [] { onUiThread([] { if (theFrame) theFrame->refreshFrame(); }); },
};

// The recorder's and the preferences' windows: the dialogs it asks for, and the meter following
// the input's level and its caption.
static void installRecordingWindows() {
    preferencesDialog = runPreferencesDialog;
    recordingHooks.quickPreferences = [] { return showQuickPreferences(PAGE_SET_RECORDING) == 0 ? 1 : 0; };
    recordingHooks.showSpeedWarning = showSpeedWarningDialog;
    recordingHooks.levelChanged = [] {
        if (theFrame && theFrame->songWindow()) theFrame->songWindow()->refreshMeter();
    };
    meterCaptionChanged = [] {
        if (theFrame && theFrame->songWindow()) theFrame->songWindow()->refreshMeterCaption();
    };
    openingState.quickPreferences = [] { return showQuickPreferences(PAGE_SET_OPENING) == 0 ? 1 : 0; };
}

static void removeRecordingWindows() {
    preferencesDialog = nullptr;
    recordingHooks.quickPreferences = nullptr;
    recordingHooks.showSpeedWarning = nullptr;
    recordingHooks.levelChanged = nullptr;
    meterCaptionChanged = nullptr;
    openingState.quickPreferences = nullptr;
}

// The MDI area; with no song open it says so in its middle.
class Workspace : public QMdiArea {
public:
    using QMdiArea::QMdiArea;

protected:
    void paintEvent(QPaintEvent* event) override {
        QMdiArea::paintEvent(event);
        if (!subWindowList().isEmpty()) return;
        QPainter g(viewport());
        g.setRenderHint(QPainter::Antialiasing);
        QRect middle(0, viewport()->height() / 2 - 90, viewport()->width(), 180);
        appIcon(ICON_PROGRAM).paint(&g, QRect(middle.center().x() - 32, middle.top(), 64, 64), Qt::AlignCenter,
                                    QIcon::Disabled);
        QFont title = font();
        title.setPointSizeF(16);
        g.setFont(title);
        g.setPen(QColor(0x8a, 0x94, 0xa0));
        g.drawText(QRect(0, middle.top() + 76, middle.width(), 32), Qt::AlignCenter, "Torvellan Melodrift");
        QFont line = font();
        line.setPointSizeF(10.5);
        g.setFont(line);
        g.setPen(QColor(0x9a, 0xa3, 0xae));
        g.drawText(QRect(0, middle.top() + 110, middle.width(), 24), Qt::AlignCenter, "No song is open");
    }
};

// The key a menu text names after its "\t", as Qt shows and takes it.
static QKeySequence keySequenceOfText(const std::string& text) {
    if (text == "Ctrl+NUM+") return QKeySequence(QKeyCombination(Qt::ControlModifier | Qt::KeypadModifier, Qt::Key_Plus));
    if (text == "Ctrl+NUM-") return QKeySequence(QKeyCombination(Qt::ControlModifier | Qt::KeypadModifier, Qt::Key_Minus));
    return QKeySequence::fromString(QString::fromStdString(text), QKeySequence::PortableText);
}

static QKeySequence keySequenceOfAccelerator(const Accelerator& a) {
    QKeyCombination key = Qt::Key_unknown;
    if (a.virtualKey >= 'A' && a.virtualKey <= 'Z') key = Qt::Key(Qt::Key_A + (a.virtualKey - 'A'));
    else if (a.virtualKey == KEY_SPACE) key = Qt::Key_Space;
    else if (a.virtualKey == KEY_NUMPAD_ADD) key = Qt::KeypadModifier | Qt::Key_Plus;
    else if (a.virtualKey == KEY_NUMPAD_SUBTRACT) key = Qt::KeypadModifier | Qt::Key_Minus;
    else if (a.virtualKey == KEY_F1) key = Qt::Key_F1;
    else if (a.virtualKey == KEY_F4) key = Qt::Key_F4;
    Qt::KeyboardModifiers modifiers = key.keyboardModifiers();
    if (a.modifiers & ACCEL_CONTROL) modifiers |= Qt::ControlModifier;
    if (a.modifiers & ACCEL_SHIFT) modifiers |= Qt::ShiftModifier;
    if (a.modifiers & ACCEL_ALT) modifiers |= Qt::AltModifier;
    return QKeySequence(QKeyCombination(modifiers, key.key()));
}

MainFrame::MainFrame() {
    theFrame = this;
    setObjectName("CANTOSCOPE_APP");
    setWindowTitle("Torvellan Melodrift");
    setWindowIcon(appIcon(ICON_PROGRAM));
    resize(1024, 720);

    mdi = new Workspace(this);
    mdi->setObjectName("MDICLIENT");
    mdi->setBackground(workspaceColor());
    mdi->setHorizontalScrollBarPolicy(Qt::ScrollBarAsNeeded);
    mdi->setVerticalScrollBarPolicy(Qt::ScrollBarAsNeeded);
    setCentralWidget(mdi);

    buildMenus();
    buildAccelerators();
    buildToolbar();
    buildStatusBar();
    setQtUiWindow(this, parts[1]);
    setFrameWindowFunctions(&frameWindowFunctions);
    installRecordingWindows();

    // The end of the session is refused like closing the frame.
    connect(qApp, &QGuiApplication::commitDataRequest, this, [this](QSessionManager& manager) {
        if (!frameMayClose()) manager.cancel();
        else storePlacement();
    });

    applyStoredPlacement();
    refreshFrame();
}

MainFrame::~MainFrame() {
    // The child windows go after this destructor; their end must not call back into it.
    if (songSubWindow) songSubWindow->disconnect(this);
    setFrameWindowFunctions(nullptr);
    removeRecordingWindows();
    setQtUiWindow(nullptr, nullptr);
    frameState.songWindowOpen = false;
    if (theFrame == this) theFrame = nullptr;
}

void MainFrame::buildMenus() {
    QList<QMenu*> stack;
    for (int i = 0; i < menuBarCount; i++) {
        const MenuItem& item = ::menuBar[i];
        if (item.kind == MENU_POPUP) {
            QMenu* menu = stack.isEmpty() ? menuBar()->addMenu(item.text) : stack.last()->addMenu(item.text);
            menu->setObjectName(QString("popup%1").arg(item.id));
            menu->menuAction()->setData(-item.id);
            popups[item.id] = menu;
            connect(menu, &QMenu::aboutToShow, this, [this, menu] { updateMenu(menu); });
            stack.append(menu);
        } else if (item.kind == MENU_END) {
            stack.removeLast();
        } else if (item.kind == MENU_SEPARATOR) {
            stack.last()->addSeparator();
        } else {
            const CommandEntry* entry = findCommand(item.id);
            QAction* action = stack.last()->addAction(QString::fromStdString(commandLabel(item.id)));
            action->setObjectName(QString("command%1").arg(item.id));
            action->setData(item.id);
            std::string key = commandKeyText(item.id);
            if (!key.empty()) {
                action->setShortcut(keySequenceOfText(key));
                // Shown beside the item, taken only by the open menu: the frame's keys are the
                // accelerator table's.
                action->setShortcutContext(Qt::WidgetShortcut);
            }
            switch (entry->id) {
            case CMD_CHROMATIC:
            case CMD_DIATONIC:
            case CMD_NOTE_MODE:
            case CMD_DETAIL_MODE:
            case CMD_MIDI_MODE:
            case CMD_WAVE_MODE: action->setCheckable(true); break;
            default: break;
            }
            int id = item.id;
            connect(action, &QAction::triggered, this, [this, id] { runCommand(id); });
            actions[id] = action;
        }
    }
}

void MainFrame::buildAccelerators() {
    for (int i = 0; i < acceleratorTableCount; i++) {
        const Accelerator& a = acceleratorTable[i];
        auto* action = new QAction(this);
        action->setObjectName(QString("accelerator%1").arg(a.command));
        action->setShortcut(keySequenceOfAccelerator(a));
        action->setShortcutContext(Qt::WindowShortcut);
        int id = a.command;
        connect(action, &QAction::triggered, this, [this, id] { runCommand(id); });
        addAction(action);
        accelerators.append(action);
    }
}

void MainFrame::buildToolbar() {
    QToolBar* bar = addToolBar("Toolbar");
    bar->setObjectName("OwnToolbar");
    bar->setMovable(false);
    bar->setFloatable(false);
    bar->setIconSize(QSize(20, 20));
    bar->setToolButtonStyle(Qt::ToolButtonTextBesideIcon);
    bar->setContextMenuPolicy(Qt::PreventContextMenu);

    toolbarMenu = new QMenu(this);
    toolbarMenu->setObjectName("toolbarMenu");
    for (int id : {POPUP_FILE, POPUP_EDIT, POPUP_VIEW, POPUP_NOTES, POPUP_PLAY, POPUP_WINDOW, POPUP_HELP})
        toolbarMenu->addMenu(popups[id]);

    auto makeButton = [bar](const char* name) {
        auto* button = new QToolButton(bar);
        button->setObjectName(name);
        button->setToolButtonStyle(Qt::ToolButtonTextBesideIcon);
        button->setAutoRaise(true);
        bar->addWidget(button);
        return button;
    };
    buttons[0] = makeButton("menuButton");
    buttons[0]->setIcon(appIcon(ICON_MENU));
    buttons[0]->setText("Menu");
    buttons[0]->setToolTip("All commands");
    buttons[0]->setMenu(toolbarMenu);
    buttons[0]->setPopupMode(QToolButton::InstantPopup);
    bar->addSeparator();
    buttons[1] = makeButton("playbackModeButton");
    buttons[2] = makeButton("noteModeButton");
    buttons[3] = makeButton("layoutButton");
    connect(buttons[1], &QToolButton::clicked, this, [this] {
        runCommand(displayModes.playbackMode == PLAYBACK_MODE_WAVE ? CMD_MIDI_MODE : CMD_WAVE_MODE);
    });
    connect(buttons[2], &QToolButton::clicked, this, [this] {
        runCommand(displayModes.noteMode == NOTE_MODE_DETAIL ? CMD_NOTE_MODE : CMD_DETAIL_MODE);
    });
    connect(buttons[3], &QToolButton::clicked, this, [this] {
        runCommand((globalSettings.scaleMode & LAYOUT_CHROMATIC) ? CMD_DIATONIC : CMD_CHROMATIC);
    });
}

void MainFrame::buildStatusBar() {
    QStatusBar* bar = statusBar();
    bar->setObjectName("statusBar");
    bar->setSizeGripEnabled(false);
    for (int i = 0; i < 4; i++) {
        parts[i] = new QLabel(bar);
        parts[i]->setObjectName(QString("statusPart%1").arg(i + 1));
    }
    parts[1]->setMinimumWidth(190);
    bar->addWidget(parts[0], 1);
    bar->addPermanentWidget(parts[1]);
    bar->addPermanentWidget(parts[2]);
    bar->addPermanentWidget(parts[3]);
    tipTimer = new QTimer(this);
    tipTimer->setSingleShot(true);
    connect(tipTimer, &QTimer::timeout, this, [this] { parts[0]->setText("Ready"); });
    parts[0]->setText("Ready");
}

void MainFrame::showFrame() {
    if (openMaximized) showMaximized();
    else showNormal();
}

void MainFrame::applyStoredPlacement() {
    WindowPlacement p;
    openMaximized = true;
    if (!readMainWindowPlacement(&p)) return;
    QRect normal(p.left, p.top, p.right - p.left, p.bottom - p.top);
    // A placement from another screen layout, or a damaged one, must not put the frame where
    // nobody can see it.
    bool visible = false;
    for (QScreen* screen : QGuiApplication::screens())
        if (screen->availableGeometry().intersected(normal).width() >= 100 &&
            screen->availableGeometry().intersected(normal).height() >= 100)
            visible = true;
    if (visible && normal.width() >= 320 && normal.height() >= 240) setGeometry(normal);
    openMaximized = p.showState == SHOW_MAXIMIZED;
}

void MainFrame::storePlacement() {
    QRect normal = isMaximized() || isMinimized() ? normalGeometry() : geometry();
    if (!normal.isValid()) normal = geometry();
    WindowPlacement p{};
    p.showState = isMaximized() ? SHOW_MAXIMIZED : isMinimized() ? SHOW_MINIMIZED : SHOW_NORMAL;
    p.minX = p.minY = p.maxX = p.maxY = -1;
    p.left = normal.left();
    p.top = normal.top();
    p.right = normal.left() + normal.width();
    p.bottom = normal.top() + normal.height();
    storeMainWindowPlacement(p);
}

void MainFrame::closeEvent(QCloseEvent* event) {
    if (!frameMayClose()) {
        event->ignore();
        return;
    }
    storePlacement();
    event->accept();
    // The frame is gone for the user: the loop ends with exit code 0 and shut-down follows.
    postQuit(0);
}

void MainFrame::runCommand(int id) {
    if (dispatchCommand(id) == COMMAND_FOR_FRAME) frameCommand(id);
    refreshFrame();
}

void MainFrame::frameCommand(int id) {
    switch (id) {
    case CMD_OPEN: openCommand(); break;
    case CMD_CLOSE: closeActiveChild(); break;
    case CMD_SAVE: saveCommand(); break;
    case CMD_SAVE_AS: saveAsCommand(); break;
    case CMD_EXIT: close(); break;
    case CMD_CASCADE: mdi->cascadeSubWindows(); break;
    case CMD_TILE_HORIZONTALLY: tileChildren(true); break;
    case CMD_TILE_VERTICALLY: tileChildren(false); break;
    case CMD_CLOSE_ALL: closeAllChildren(); break;
    case CMD_HELP: showHelp(); break;
    case CMD_RECORDING_TIPS: showRecordingTips(); break;
    case CMD_ABOUT: showAbout(); break;
    case CMD_INSTRUMENTS: showInstrumentWindow(this); break;
    case CMD_RECORDING_SOURCE: showQuickPreferences(PAGE_SET_SOURCE); break;
    case CMD_PREFERENCES: runPreferencesDialog(PAGE_SET_ALL); break;
    default: break;
    }
}

void MainFrame::openCommand() {
    QStringList files = runOpenDialog(this);
    if (files.isEmpty()) return;
    std::vector<std::string> paths;
    for (const QString& file : files) paths.push_back(file.toStdString());
    queueFilesToOpen(paths);
    workOffOpenQueue();
}

void MainFrame::saveCommand() {
    if (!frameState.songWindowOpen) return;
    if (saveSong() == SAVE_NEEDS_DIALOG) saveAsCommand();
}

void MainFrame::saveAsCommand() {
    if (!frameState.songWindowOpen || !saveAllowed()) return;
    QString name = runSaveDialog(this);
    if (name.isEmpty()) return;
    writeSongOutput(name.toStdString(), frameState.onlySaveSelectedRange);
}

void MainFrame::closeActiveChild() {
    if (QMdiSubWindow* active = mdi->activeSubWindow()) active->close();
    else if (!mdi->subWindowList().isEmpty()) mdi->subWindowList().first()->close();
}

void MainFrame::closeAllChildren() {
    for (QMdiSubWindow* child : mdi->subWindowList()) child->close();
}

void MainFrame::tileChildren(bool horizontally) {
    QList<QMdiSubWindow*> children = mdi->subWindowList();
    if (children.isEmpty()) return;
    QRect area = mdi->viewport()->rect();
    int n = int(children.size());
    for (int i = 0; i < n; i++) {
        children[i]->showNormal();
        if (horizontally) children[i]->setGeometry(0, i * area.height() / n, area.width(), area.height() / n);
        else children[i]->setGeometry(i * area.width() / n, 0, area.width() / n, area.height());
    }
}

void MainFrame::showSongWindow() {
    if (!songSubWindow) {
        auto* view = new SongWindow;
        songSubWindow = mdi->addSubWindow(view);
        songSubWindow->setObjectName("WaveviewM");
        songSubWindow->setWindowTitle("Waveview display");
        songSubWindow->setWindowIcon(appIcon(ICON_PROGRAM));
        songSubWindow->setAttribute(Qt::WA_DeleteOnClose);
        QSize area = mdi->viewport()->size();
        songSubWindow->resize(std::max(480, area.width() * 3 / 4), std::max(320, area.height() * 3 / 4));
        connect(songSubWindow, &QObject::destroyed, this, [this] {
            songSubWindow = nullptr;
            refreshFrame();
        });
        songWindowOpened();
    }
    songSubWindow->show();
    mdi->setActiveSubWindow(songSubWindow);
    refreshSongWindow();
    refreshFrame();
}

void MainFrame::refreshSongWindow() {
    if (SongWindow* view = songWindow()) view->refresh();
    // An edited song says so in its title.
    if (songSubWindow) songSubWindow->setWindowTitle(song.changed ? "Waveview display *" : "Waveview display");
}

SongWindow* MainFrame::songWindow() const {
    return songSubWindow ? qobject_cast<SongWindow*>(songSubWindow->widget()) : nullptr;
}

void MainFrame::refreshFrame() {
    showModeButtons(buttons[1], buttons[2], buttons[3]);

    if (QAction* record = commandAction(CMD_RECORD)) record->setText(recordLabel());
    if (!frameState.songWindowOpen) parts[2]->setText("No song");
    else if (audioActivity.recording && recordingState.labelState == RECORD_LABEL_FINISHING)
        parts[2]->setText(QString("Finishing  ·  %1 s").arg(songDuration(), 0, 'f', 1));
    else if (audioActivity.recording)
        parts[2]->setText(QString("Recording  ·  %1 s").arg(recordingState.recordedSeconds, 0, 'f', 1));
    else if (audioActivity.opening) parts[2]->setText("Opening");
    else parts[2]->setText(QString("%1 notes  ·  %2 s").arg(noteList.count).arg(songDuration(), 0, 'f', 1));
    parts[3]->setText(QString("Zoom %1%").arg(zoomPercent()));
}

void MainFrame::showTip(const QString& tip) {
    parts[0]->setText(tip);
    tipTimer->start(8000);
}

void MainFrame::updateMenu(QMenu* menu) {
    MenuState state = currentMenuState();
    for (QAction* action : menu->actions()) {
        if (action->isSeparator() || !action->data().isValid()) continue;
        int id = action->data().toInt();
        // Popups carry their id negated, so they never meet a command id.
        action->setEnabled(commandEnabled(id < 0 ? -id : id, state) == 1);
        if (action->isCheckable()) action->setChecked(commandChecked(id, state) == 1);
    }
}

QAction* MainFrame::commandAction(int id) const {
    auto it = actions.find(id);
    return it == actions.end() ? nullptr : it->second;
}

QMenu* MainFrame::popupMenu(int popupId) const {
    auto it = popups.find(popupId);
    return it == popups.end() ? nullptr : it->second;
}

QList<QAction*> MainFrame::acceleratorActions() const { return accelerators; }

QLabel* MainFrame::statusPart(int part) const { return part >= 1 && part <= 4 ? parts[part - 1] : nullptr; }

QToolButton* MainFrame::toolbarButton(int which) const { return which >= 0 && which < 4 ? buttons[which] : nullptr; }

// ---- Help, recording tips and About ----

void MainFrame::showHelp() { showHelpWindow(this, HELP_PAGE_HELP); }

void MainFrame::showRecordingTips() { showHelpWindow(this, HELP_PAGE_RECORDING_TIPS); }

void MainFrame::showAbout() { showAboutBox(this); }
