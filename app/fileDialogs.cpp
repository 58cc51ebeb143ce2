// The Open and Save dialogs. They are Qt's own dialogs (not the desktop's), because the Save
// dialog carries the extra check box below its file list.
#include "app/fileDialogs.h"

#include <QCheckBox>
#include <QDir>
#include <QFileDialog>
#include <QFileInfo>
#include <QGridLayout>

#include "shell/commandTable.h"
#include "shell/mainFrame.h"
#include "shell/saveSong.h"
#include "shell/settings.h"

static QString startFolder(const std::string& stored) {
    QString folder = QString::fromStdString(stored);
    return !folder.isEmpty() && QDir(folder).exists() ? folder : QDir::currentPath();
}

QFileDialog* createOpenDialog(QWidget* parent) {
    auto* dialog = new QFileDialog(parent, "Open");
    dialog->setObjectName("openDialog");
    dialog->setOption(QFileDialog::DontUseNativeDialog);
    dialog->setAcceptMode(QFileDialog::AcceptOpen);
    dialog->setFileMode(QFileDialog::ExistingFiles);
    QStringList filters = {QString("%1 (*.wav)").arg(WAVE_FILES_FILTER_NAME),
                           QString("%1 (*.mid *.midi)").arg(MIDI_FILES_FILTER_NAME)};
    dialog->setNameFilters(filters);
    // The filter the dialog was last left with, counted from 1.
    int stored = globalSettings.openFilter;
    if (stored >= 1 && stored <= filters.size()) dialog->selectNameFilter(filters[stored - 1]);
    dialog->setDirectory(startFolder(globalSettings.openDirectory));
    return dialog;
}

QFileDialog* createSaveDialog(QWidget* parent) {
    SaveDialogSetup setup = saveDialogSetup();
    auto* dialog = new QFileDialog(parent, "Save As");
    dialog->setObjectName("saveDialog");
    dialog->setOption(QFileDialog::DontUseNativeDialog);
    dialog->setAcceptMode(QFileDialog::AcceptSave);
    dialog->setFileMode(QFileDialog::AnyFile);
    QString pattern = QString::fromStdString(setup.pattern);
    dialog->setNameFilters({QString("%1 (%2)").arg(QString::fromStdString(setup.filterName), pattern)});
    dialog->setDefaultSuffix(pattern.mid(2));

    QFileInfo proposed(QString::fromStdString(setup.proposedName));
    if (!setup.proposedName.empty() && proposed.dir().exists() && proposed.isAbsolute())
        dialog->setDirectory(proposed.dir());
    else
        dialog->setDirectory(startFolder(setup.directory));
    if (!setup.proposedName.empty()) dialog->selectFile(proposed.fileName());

    auto* check = new QCheckBox("&Only save selected range", dialog);
    check->setObjectName("onlySaveSelectedRange");
    check->setChecked(frameState.onlySaveSelectedRange);
    // The dialog's own grid: the check box goes in a row of its own below the file type.
    if (auto* grid = qobject_cast<QGridLayout*>(dialog->layout())) grid->addWidget(check, grid->rowCount(), 0, 1, -1);
    QObject::connect(check, &QCheckBox::toggled, [](bool on) { frameState.onlySaveSelectedRange = on; });
    return dialog;
}

// The filter index is stored 1-based, as the first filter of the list is 1.
static int filterIndex(const QFileDialog& dialog) {
    return int(dialog.nameFilters().indexOf(dialog.selectedNameFilter())) + 1;
}

QStringList runOpenDialog(QWidget* parent) {
    QFileDialog* dialog = createOpenDialog(parent);
    QStringList files;
    if (dialog->exec() == QDialog::Accepted) {
        files = dialog->selectedFiles();
        storeOpenDialogChoice(dialog->directory().absolutePath().toStdString(), filterIndex(*dialog));
    }
    delete dialog;
    return files;
}

QString runSaveDialog(QWidget* parent) {
    QFileDialog* dialog = createSaveDialog(parent);
    QString name;
    if (dialog->exec() == QDialog::Accepted && !dialog->selectedFiles().isEmpty()) {
        name = dialog->selectedFiles().first();
        storeSaveDialogChoice(QFileInfo(name).absolutePath().toStdString(), filterIndex(*dialog));
    }
    delete dialog;
    return name;
}
