#include "reports/stagedtarget.h"

#include "core/comerror.h"

#include <QDir>
#include <QFileInfo>
#include <cerrno>
#include <cstdio>
#include <cstring>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

constexpr int32_t pathFileAccessError = 75;

[[noreturn]] void raiseAccess(const QString& text)
{
    throw core::ComError(
        pathFileAccessError, u"LUDMoxViewer115"_s, u"Path/File access error: "_s + text);
}

QTemporaryDir makeFolder(const QString& target)
{
    if (target.isEmpty())
        raiseAccess(u"no file name was given"_s);
    const QFileInfo info(target);
    // The leading dot hides the folder from file listings while the export runs.
    return QTemporaryDir(
        info.absoluteDir().filePath(u"."_s + info.fileName() + u".ludmox-XXXXXX"_s));
}

} // namespace

StagedTarget::StagedTarget(const QString& target)
    : m_target(QFileInfo(target).absoluteFilePath())
    , m_folder(makeFolder(target))
{
    if (!m_folder.isValid())
        raiseAccess(u"cannot write in the folder of %1 (%2)"_s.arg(target, m_folder.errorString()));
}

QString StagedTarget::path() const
{
    return m_folder.filePath(QFileInfo(m_target).fileName());
}

void StagedTarget::commit()
{
    const QString mainFile = path();
    if (!QFileInfo(mainFile).isFile())
        raiseAccess(u"the export wrote no file for %1"_s.arg(m_target));
    QStringList files
        = QDir(m_folder.path()).entryList(QDir::Files | QDir::Hidden | QDir::System, QDir::Name);
    const QString mainName = QFileInfo(mainFile).fileName();
    files.removeAll(mainName);
    files.append(mainName);
    const QDir targetFolder = QFileInfo(m_target).absoluteDir();
    for (const QString& name : std::as_const(files)) {
        // rename(2) replaces the destination in one step, whatever the destination's own mode;
        // QFile::rename would refuse an existing file.
        const QByteArray from = QFile::encodeName(QDir(m_folder.path()).filePath(name));
        const QByteArray to = QFile::encodeName(targetFolder.filePath(name));
        if (std::rename(from.constData(), to.constData()) != 0)
            raiseAccess(u"cannot replace %1 (%2)"_s.arg(
                targetFolder.filePath(name), QString::fromLocal8Bit(std::strerror(errno))));
    }
}

} // namespace reports
