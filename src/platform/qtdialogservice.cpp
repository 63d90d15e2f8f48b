#include "platform/qtdialogservice.h"

#include "platform/olecolor.h"
#include "platform/windowhandles.h"

#include <QColorDialog>
#include <QFileDialog>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

// An in-process owner becomes the dialog's parent; any other native window its owner.
void attachOwner(QDialog& dialog, int32_t ownerWindow)
{
    if (QWidget* owner = WindowHandles::findWidget(ownerWindow))
        dialog.setParent(owner, dialog.windowFlags());
    else
        WindowHandles::setOwner(&dialog, ownerWindow);
}

} // namespace

QStringList QtDialogService::nameFilters(const QString& filter)
{
    QStringList filters;
    const QStringList parts = filter.split(u'|');
    for (qsizetype i = 0; i + 1 < parts.size(); i += 2) {
        const QString description = parts.at(i).trimmed();
        QStringList patterns = parts.at(i + 1).split(u';', Qt::SkipEmptyParts);
        for (QString& pattern : patterns)
            pattern = pattern.trimmed();
        const QString patternText = patterns.join(u' ');
        if (patternText.isEmpty())
            continue;
        if (description.endsWith(u'(' + patternText + u')'))
            filters.append(description);
        else if (description.isEmpty())
            filters.append(u'(' + patternText + u')');
        else
            filters.append(description + u" (" + patternText + u')');
    }
    return filters;
}

std::optional<int32_t> QtDialogService::chooseColor(int32_t ownerWindow, int32_t initialColor)
{
    QColor initial = colorFromOle(initialColor);
    if (!initial.isValid())
        initial = Qt::white;
    QColorDialog dialog(initial);
    attachOwner(dialog, ownerWindow);
    if (dialog.exec() != QDialog::Accepted)
        return std::nullopt;
    return oleFromColor(dialog.selectedColor());
}

std::optional<QString> QtDialogService::openFile(const FileRequest& request)
{
    QFileDialog dialog;
    attachOwner(dialog, request.ownerWindow);
    dialog.setAcceptMode(QFileDialog::AcceptOpen);
    dialog.setFileMode(
        (request.flags & FileMustExist) ? QFileDialog::ExistingFile : QFileDialog::AnyFile);
    if (!request.title.isEmpty())
        dialog.setWindowTitle(request.title);
    const QStringList filters = nameFilters(request.filter);
    if (!filters.isEmpty())
        dialog.setNameFilters(filters);

    if (!request.initialDirectory.isEmpty())
        dialog.setDirectory(request.initialDirectory);
    if (!request.fileName.isEmpty())
        dialog.selectFile(request.fileName);

    if (dialog.exec() != QDialog::Accepted || dialog.selectedFiles().isEmpty())
        return std::nullopt;
    return dialog.selectedFiles().constFirst();
}

std::optional<QString> QtDialogService::chooseFolder(
    int32_t ownerWindow, const QString& title, const QString& initialFolder)
{
    QFileDialog dialog;
    attachOwner(dialog, ownerWindow);
    dialog.setFileMode(QFileDialog::Directory);
    dialog.setOption(QFileDialog::ShowDirsOnly);
    if (!title.isEmpty())
        dialog.setWindowTitle(title);
    if (!initialFolder.isEmpty())
        dialog.setDirectory(initialFolder);
    if (dialog.exec() != QDialog::Accepted || dialog.selectedFiles().isEmpty())
        return std::nullopt;
    return dialog.selectedFiles().constFirst();
}

} // namespace platform
