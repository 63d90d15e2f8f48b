#include "reportrt/output/stagedfile.h"

#include "reportrt/base/runtimeerror.h"

#include <QDir>
#include <QFileInfo>
#include <QRandomGenerator>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <unistd.h>

namespace reportrt {

StagedFile::StagedFile(const QString& target, const QString& what)
    : m_what(what)
{
    if (target.trimmed().isEmpty())
        raiseError(
            Error::ExportFailed, QStringLiteral("The %1 export has no file name.").arg(what));
    const QFileInfo info(target);
    m_target = info.absoluteFilePath();
    if (info.isDir())
        fail(QStringLiteral("it is a folder"));
    if (!info.absoluteDir().exists())
        fail(QStringLiteral("the folder %1 does not exist")
                 .arg(QDir::toNativeSeparators(info.absolutePath())));
    // Hidden, so file managers and folder listings do not show a file that is not there yet.
    const QString base = info.absolutePath() + u"/." + info.fileName() + u'.';
    for (int attempt = 0; attempt < 16; ++attempt) {
        m_file.setFileName(base + QString::number(QRandomGenerator::global()->generate(), 36)
            + QStringLiteral(".tmp"));
        if (m_file.open(QIODevice::WriteOnly | QIODevice::NewOnly))
            return;
        if (m_file.error() != QFileDevice::OpenError || !QFile::exists(m_file.fileName()))
            break;
    }
    fail(m_file.errorString());
}

StagedFile::~StagedFile()
{
    if (m_committed)
        return;
    m_file.close();
    QFile::remove(m_file.fileName());
}

void StagedFile::finish()
{
    if (!m_file.isOpen()) {
        // Written by a library that opened the path itself: still make it durable.
        if (!m_file.open(QIODevice::ReadOnly))
            fail(m_file.errorString());
        const bool synced = ::fsync(m_file.handle()) == 0;
        m_file.close();
        if (!synced)
            fail(QString::fromLocal8Bit(std::strerror(errno)));
        return;
    }
    if (!m_file.flush())
        fail(m_file.errorString());
    if (::fsync(m_file.handle()) != 0)
        fail(QString::fromLocal8Bit(std::strerror(errno)));
    m_file.close();
    if (m_file.error() != QFileDevice::NoError)
        fail(m_file.errorString());
}

void StagedFile::commit()
{
    finish();
    // rename(2) replaces the target in one step; QFile::rename would refuse an existing one.
    if (std::rename(QFile::encodeName(m_file.fileName()).constData(),
            QFile::encodeName(m_target).constData())
        != 0)
        fail(QString::fromLocal8Bit(std::strerror(errno)));
    m_committed = true;
}

void StagedFile::fail(const QString& reason) const
{
    raiseError(Error::ExportFailed,
        QStringLiteral("Cannot write the %1 file %2: %3")
            .arg(m_what, QDir::toNativeSeparators(m_target), reason));
}

} // namespace reportrt
