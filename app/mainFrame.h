#pragma once
// The main frame (window class CANTOSCOPE_APP): menu bar, accelerators, toolbar, the MDI area
// holding the song's window, and the status bar. It turns menu items, keys and toolbar
// buttons into the engine's command dispatch, enables the menu items by the engine's rules
// each time a menu opens, and runs the commands that need a window: the Open and Save
// dialogs, closing, the Window and Help commands.

#include <map>

#include <QMainWindow>

class QLabel;
class QMdiArea;
class QMdiSubWindow;
class QMenu;
class QToolButton;
class SongWindow;

class MainFrame : public QMainWindow {
    Q_OBJECT
public:
    MainFrame();
    ~MainFrame() override;

    // Shows the frame with its stored placement: maximized unless a normal one is stored.
    void showFrame();
    // Runs a command by id, as a menu item or key would.
    void runCommand(int id);

    // Creates, or brings forward, the song's child window.
    void showSongWindow();
    void refreshSongWindow();
    // Toolbar buttons and status bar parts follow the modes, the zoom and the song.
    void refreshFrame();
    // Shows a mode tip in the status bar's first part.
    void showTip(const QString& tip);

    // Enables and checks the items of menu by the engine's rules (done on every show).
    void updateMenu(QMenu* menu);

    QAction* commandAction(int id) const;         // the menu item of a command
    QMenu* popupMenu(int popupId) const;          // a popup of the menu bar
    QList<QAction*> acceleratorActions() const;   // the keys of accelerator table 130
    QMdiArea* mdiArea() const { return mdi; }
    SongWindow* songWindow() const;
    QLabel* statusPart(int part) const;           // 1 to 4
    QToolButton* toolbarButton(int which) const;  // 0 menu, 1 playback mode, 2 note mode, 3 layout

protected:
    void closeEvent(QCloseEvent* event) override;

private:
    void buildMenus();
    void buildAccelerators();
    void buildToolbar();
    void buildStatusBar();
    void frameCommand(int id);
    void openCommand();
    void saveCommand();
    void saveAsCommand();
    void closeActiveChild();
    void closeAllChildren();
    void tileChildren(bool horizontally);
    void showHelp();
    void showRecordingTips();
    void showAbout();
    void applyStoredPlacement();
    void storePlacement();

    std::map<int, QAction*> actions;   // menu items by command id
    std::map<int, QMenu*> popups;      // popups by PopupId
    QList<QAction*> accelerators;
    QMenu* toolbarMenu = nullptr;
    QMdiArea* mdi = nullptr;
    QMdiSubWindow* songSubWindow = nullptr;
    QLabel* parts[4] = {};
    QToolButton* buttons[4] = {};
    QTimer* tipTimer = nullptr;
    bool openMaximized = true;
};

// The frame of the running program, or nullptr.
MainFrame* mainFrame();
