#include "reportrt/base/durablefile_p.h"
#include "reportrt/base/logging_p.h"

#include <QFileInfo>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <unistd.h>

namespace reportrt {

namespace {
QString systemError(int error)
{
    return QString::fromLocal8Bit(std::strerror(error));
}

/// The rename itself is durable only once the folder's entry is on the disk. The new file
/// is complete by then, so a failure here is only worth a warning.
void syncFolder(const QString& path)
{
    const QByteArray folder = QFile::encodeName(QFileInfo(path).absolutePath());
    const int fd = ::open(folder.constData(), O_RDONLY | O_DIRECTORY | O_CLOEXEC);
    if (fd < 0 || ::fsync(fd) != 0)
        qCWarning(
            lcOutput, "Could not sync the folder %s: %s", folder.constData(), std::strerror(errno));
    if (fd >= 0)
        ::close(fd);
}
} // namespace

DurableFile::DurableFile(const QString& path)
    : QSaveFile(path)
{ }

DurableFile::~DurableFile()
{
    if (isOpen())
        abandon();
}

bool DurableFile::start()
{
    if (open(QIODevice::WriteOnly))
        return true;
    fail(errorString());
    return false;
}

qint64 DurableFile::writeData(const char* data, qint64 length)
{
    if (m_failed)
        return -1;
    // A write may take part of the data only; the rest is tried again, which either
    // completes or gives the reason (ENOSPC, EFBIG) the partial write did not.
    qint64 done = 0;
    while (done < length) {
        const qint64 written = QSaveFile::writeData(data + done, length - done);
        if (written <= 0) {
            fail(errorString());
            return done > 0 ? done : -1;
        }
        done += written;
    }
    return done;
}

bool DurableFile::finish()
{
    if (!m_failed && !isOpen())
        fail(QStringLiteral("the file is not open"));
    // A short write leaves the rest of the buffer behind; writing it again completes or
    // gives the reason the first attempt stopped, which a short write does not tell.
    if (!m_failed && !flush() && !flush())
        fail(errorString());
    if (!m_failed && ::fsync(handle()) != 0)
        fail(systemError(errno));
    if (m_failed) {
        abandon();
        return false;
    }
    if (!commit()) {
        fail(errorString());
        return false;
    }
    syncFolder(fileName());
    return true;
}

void DurableFile::abandon()
{
    if (!isOpen())
        return;
    cancelWriting();
    // A cancelled commit removes the temporary file at once instead of at destruction.
    commit();
}

void DurableFile::fail(const QString& why)
{
    if (m_failed)
        return;
    m_failed = true;
    m_failure = why.isEmpty() ? QStringLiteral("the data could not be written") : why;
}

} // namespace reportrt
