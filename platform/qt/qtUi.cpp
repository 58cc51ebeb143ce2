// Message boxes, cursor, status text, progress and beep on Qt. Everything runs on the user
// interface thread: a worker's box is carried there (an information or error box without
// waiting for it, a question waiting for the answer), and so are its status texts.
#include "platform/qt/qtUi.h"

#include <QApplication>
#include <QClipboard>
#include <QMimeData>
#include <QLabel>
#include <QMessageBox>
#include <QPointer>
#include <QProgressDialog>
#include <QThread>
#include <QWidget>

#include "platform/ui.h"

static QPointer<QWidget> ownerWindow;     // the main frame
static QPointer<QLabel> statusLabel;      // the status bar's second part
static QPointer<QProgressDialog> progress;
static bool waitCursorOn = false;

static bool onUiThread() { return QThread::currentThread() == qApp->thread(); }

static QMessageBox::Icon iconOfKind(int kind) {
    switch (kind) {
    case MESSAGE_ERROR: return QMessageBox::Critical;
    case MESSAGE_QUESTION: return QMessageBox::Question;
    case MESSAGE_WARNING: return QMessageBox::Warning;
    default: return QMessageBox::Information;
    }
}

static int showBox(const QString& title, const QString& text, int kind, int buttons) {
    // A box must not open while a widget holds the mouse: the drag would end inside it.
    if (QWidget* grabber = QWidget::mouseGrabber()) grabber->releaseMouse();
    QMessageBox box(iconOfKind(kind), title, text,
                    buttons == BUTTONS_YES_NO ? QMessageBox::Yes | QMessageBox::No : QMessageBox::Ok, ownerWindow.data());
    box.setObjectName("messageBox");
    int answer = box.exec();
    if (buttons != BUTTONS_YES_NO) return ANSWER_OK;
    return answer == QMessageBox::Yes ? ANSWER_YES : ANSWER_NO;
}

static int qtMessageBox(const std::string& title, const std::string& text, int kind, int buttons) {
    QString qTitle = QString::fromStdString(title), qText = QString::fromStdString(text);
    if (onUiThread()) return showBox(qTitle, qText, kind, buttons);
    if (buttons != BUTTONS_YES_NO) {
        QMetaObject::invokeMethod(qApp, [qTitle, qText, kind] { showBox(qTitle, qText, kind, BUTTONS_OK); },
                                  Qt::QueuedConnection);
        return ANSWER_OK;
    }
    // The worker waits for the answer, so it must not ask while holding a lock the user
    // interface thread may be waiting for.
    int answer = ANSWER_NO;
    QMetaObject::invokeMethod(qApp, [&] { answer = showBox(qTitle, qText, kind, buttons); },
                              Qt::BlockingQueuedConnection);
    return answer;
}

// Runs call on the user interface thread: at once when already there, else queued.
template <class Call> static void onUi(Call call) {
    if (onUiThread()) call();
    else QMetaObject::invokeMethod(qApp, call, Qt::QueuedConnection);
}

static void qtSetWaitCursor(bool on) {
    onUi([on] {
        if (on == waitCursorOn) return;
        waitCursorOn = on;
        if (on) QApplication::setOverrideCursor(Qt::WaitCursor);
        else QApplication::restoreOverrideCursor();
    });
}

static void qtSetStatusText(const std::string& text) {
    QString qText = QString::fromStdString(text);
    onUi([qText] {
        if (statusLabel) statusLabel->setText(qText);
    });
}

static void qtBeginProgress(const std::string& title, int total) {
    QString qTitle = QString::fromStdString(title);
    onUi([qTitle, total] {
        delete progress.data();
        progress = new QProgressDialog(qTitle, QString(), 0, total, ownerWindow.data());
        progress->setObjectName("progressWindow");
        progress->setWindowTitle(qTitle);
        progress->setCancelButton(nullptr);
        progress->setWindowModality(Qt::WindowModal);
        progress->setMinimumDuration(0);
        progress->setAutoClose(false);
        progress->setAutoReset(false);
        progress->setValue(0);
        progress->show();
    });
}

static void qtStepProgress(int done) {
    onUi([done] {
        if (progress) progress->setValue(done);
    });
}

static void qtEndProgress() {
    onUi([] {
        delete progress.data();
    });
}

static void qtBeep() {
    onUi([] { QApplication::beep(); });
}

// The wave goes on the clipboard as audio/wav, the type other audio programs paste.
static int qtSetClipboardWave(const std::vector<uint8_t>& riffWave) {
    QByteArray bytes(reinterpret_cast<const char*>(riffWave.data()), qsizetype(riffWave.size()));
    onUi([bytes] {
        auto* data = new QMimeData;
        data->setData("audio/wav", bytes);
        data->setData("audio/x-wav", bytes);
        QGuiApplication::clipboard()->setMimeData(data);
    });
    return 1;
}

static const UiBackend qtUiBackend = {qtMessageBox,   qtSetWaitCursor, qtSetStatusText, qtBeginProgress,
                                      qtStepProgress, qtEndProgress,   qtBeep,          qtSetClipboardWave};

void installQtUi() { setUiBackend(&qtUiBackend); }

void setQtUiWindow(QWidget* frame, QLabel* statusText) {
    ownerWindow = frame;
    statusLabel = statusText;
}
