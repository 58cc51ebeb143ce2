#pragma once
// The Qt backend of platform/ui: message boxes owned by the main frame, the wait cursor, the
// status bar's second part, the progress window and the beep. The desktop program installs
// it once the application object exists and tells it its frame and status part.

class QLabel;
class QWidget;

// Installs the backend (setUiBackend). Calls from other threads are carried to the user
// interface thread.
void installQtUi();
// The window that owns the boxes and the progress window, and the label of the status bar's
// second part; either may be nullptr (before the frame exists, after it is gone).
void setQtUiWindow(QWidget* frame, QLabel* statusText);
