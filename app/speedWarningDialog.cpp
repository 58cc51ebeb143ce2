// The real-time information box of a recording.
#include "app/speedWarningDialog.h"

#include <QCheckBox>
#include <QDialog>
#include <QHBoxLayout>
#include <QLabel>
#include <QPointer>
#include <QPushButton>
#include <QVBoxLayout>

#include "app/mainFrame.h"
#include "audio/recording.h"
#include "shell/settings.h"

static QPointer<QDialog> box;

QDialog* speedWarningDialog() { return box; }

void showSpeedWarningDialog() {
    if (box) {
        box->raise();
        return;
    }
    box = new QDialog(mainFrame());
    box->setObjectName("CSSpeedWarning");
    box->setAttribute(Qt::WA_DeleteOnClose);
    box->setWindowTitle(SPEED_WARNING_TITLE);
    auto* layout = new QVBoxLayout(box);
    auto* explanation = new QLabel(SPEED_WARNING_TEXT, box);
    explanation->setWordWrap(true);
    layout->addWidget(explanation);
    auto* showNextTime = new QCheckBox("&Show this next time", box);
    showNextTime->setChecked(globalSettings.showSpeedWarning);
    QObject::connect(showNextTime, &QCheckBox::toggled, box, [](bool on) { setShowSpeedWarning(on); });
    layout->addWidget(showNextTime);
    auto* buttons = new QHBoxLayout;
    auto* maximize = new QPushButton("&Maximize speed", box);
    maximize->setObjectName("maximizeSpeed");
    auto* close = new QPushButton("OK", box);
    close->setDefault(true);
    QObject::connect(maximize, &QPushButton::clicked, box, [] {
        maximizeRecordingSpeed();
        if (box) box->close();
    });
    QObject::connect(close, &QPushButton::clicked, box, [] {
        if (box) box->close();
    });
    buttons->addStretch(1);
    buttons->addWidget(maximize);
    buttons->addWidget(close);
    layout->addLayout(buttons);
    box->show();
}
