// The preferences dialog and the recorder's windows on screen: the pages each request shows,
// confirming and cancelling through the widgets, the recording page over the fake mixer, the
// real-time information box's buttons, and the Record label of the menu.
#include <QCheckBox>
#include <QComboBox>
#include <QListWidget>
#include <QPushButton>
#include <QRadioButton>
#include <QSlider>
#include <QTabWidget>
#include <QTest>

#include "app/mainFrame.h"
#include "app/preferencesDialog.h"
#include "app/speedWarningDialog.h"
#include "appTestSupport.h"
#include "audio/recording.h"
#include "audio/recordingSource.h"
#include "platform/mixer.h"
#include "platform/registry.h"
#include "shell/commandTable.h"

// Runs action on the preferences dialog once it is up.
static void onDialog(std::function<void(PreferencesDialog*)> action) {
    auto* poll = new QTimer;
    QObject::connect(poll, &QTimer::timeout, [poll, action] {
        PreferencesDialog* dialog = currentPreferencesDialog();
        if (!dialog || !dialog->isVisible()) return;
        poll->stop();
        poll->deleteLater();
        action(dialog);
    });
    poll->start(10);
}

static QStringList tabTitles(PreferencesDialog* dialog) {
    QStringList titles;
    for (int i = 0; i < dialog->tabs()->count(); i++) titles << dialog->tabs()->tabText(i);
    return titles;
}

class PreferencesDialogTest : public QObject {
    Q_OBJECT
private slots:
    void init() {
        resetEngineState();
        resetPreferences();
        resetRecordingState();
        fakeMixer = FakeMixer{};
        fakeMixer.sources = {{"Line In", false}, {"Microphone", true}};
        fakeMixer.levels = {0, 30000};
        fakeMixer.on = {true, true};
        fakeMixer.selected = 0;
        installFakeMixer();
        frame = new MainFrame;
        frame->showFrame();
        QVERIFY(QTest::qWaitForWindowExposed(frame));
    }
    void cleanup() {
        delete frame;
        frame = nullptr;
        setMixerBackend(nullptr);
        resetPreferences();
        resetEngineState();
    }

    void eachRequestShowsItsPagesAndButton() {
        struct Case {
            int pageSet;
            QStringList tabs;
            QString button;
        };
        const Case cases[] = {
            {PAGE_SET_ALL, {" Recording ", " Accuracy / Speed ", " Editing ", " General "}, "&OK"},
            {PAGE_SET_OPENING, {" Accuracy / Speed "}, "&Open"},
            {PAGE_SET_RECORDING, {" Accuracy / Speed "}, "Rec&ord"},
            {PAGE_SET_SOURCE, {" Recording "}, "&OK"},
        };
        for (const Case& c : cases) {
            QStringList tabs;
            QString button;
            onDialog([&](PreferencesDialog* dialog) {
                tabs = tabTitles(dialog);
                button = dialog->confirmButton()->text();
                dialog->reject();
            });
            QCOMPARE(runPreferencesDialog(c.pageSet), 0);
            QCOMPARE(tabs, c.tabs);
            QCOMPARE(button, c.button);
        }
    }

    void okKeepsWhatThePagesSayAndCancelPutsTheSourceBack() {
        onDialog([](PreferencesDialog* dialog) {
            dialog->findChildren<QRadioButton*>()[2]->setChecked(true);   // Very Low
            dialog->findChild<QListWidget*>("sourceList")->setCurrentRow(1);
            dialog->confirmButton()->click();
        });
        frame->runCommand(CMD_PREFERENCES);
        QCOMPARE(generalSettings.pitchRange, 2);
        QCOMPARE(fakeMixer.selected, 1);

        onDialog([](PreferencesDialog* dialog) {
            dialog->findChild<QListWidget*>("sourceList")->setCurrentRow(0);
            dialog->findChild<QSlider*>("levelSlider")->setValue(0);   // the top: loudest
            QCOMPARE(fakeMixer.levels[0], 65535);
            dialog->reject();
        });
        frame->runCommand(CMD_RECORDING_SOURCE);
        QCOMPARE(fakeMixer.selected, 1);
        QCOMPARE(fakeMixer.levels[0], 0);
    }

    void theInformationBoxCanMaximizeSpeed() {
        showSpeedWarningDialog();
        QDialog* box = speedWarningDialog();
        QVERIFY(box);
        QCOMPARE(box->windowTitle(), QString("Information for Recording in Real-Time"));
        box->findChild<QCheckBox*>()->setChecked(false);
        QVERIFY(!globalSettings.showSpeedWarning);
        box->findChild<QPushButton*>("maximizeSpeed")->click();
        QCOMPARE(QString::fromStdString(lastMessageText()),
                 QString("These preference changes will come into effect after the current song is closed."));
        QVERIFY(globalSettings.boostSpeed);
        QCOMPARE(globalSettings.inputWaveQuality, 8);
        QTRY_VERIFY(!speedWarningDialog());
    }

    void theRecordItemNamesWhatPressingItDoes() {
        QCOMPARE(frame->commandAction(CMD_RECORD)->text(), QString("&Record Audio..."));
        recordingState.labelState = RECORD_LABEL_RECORDING;
        frame->refreshFrame();
        QCOMPARE(frame->commandAction(CMD_RECORD)->text(), QString("&Stop Recording"));
        recordingState.labelState = RECORD_LABEL_FINISHING;
        frame->refreshFrame();
        QCOMPARE(frame->commandAction(CMD_RECORD)->text(), QString("Finishing..."));
        recordingState.labelState = RECORD_LABEL_IDLE;
    }

private:
    MainFrame* frame = nullptr;
};

int runPreferencesDialogTests(int argc, char** argv) {
    PreferencesDialogTest test;
    return QTest::qExec(&test, argc, argv);
}

#include "preferencesDialogTest.moc"
