#include "reportrt/data/spillfile.h"

#include "platform/tempfolder.h"
#include "reportrt/base/runtimeerror.h"

#include <QFile>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <unistd.h>

namespace reportrt {

namespace {
[[noreturn]] void spillFailed(const QString& what, int error)
{
    raiseError(Error::RuntimeFailure,
        QStringLiteral("The records do not fit in memory and %1: %2.")
            .arg(what, QString::fromLocal8Bit(std::strerror(error))));
}

// O_TMPFILE makes a file that never has a name; file systems without it get a named file
// that is unlinked at once.
int openNameless(const QByteArray& folder)
{
    const int descriptor = ::open(folder.constData(), O_TMPFILE | O_RDWR | O_CLOEXEC, 0600);
    if (descriptor >= 0 || (errno != EOPNOTSUPP && errno != EISDIR && errno != EINVAL))
        return descriptor;
    QByteArray pattern = folder + "/records-XXXXXX";
    const int named = ::mkostemp(pattern.data(), O_CLOEXEC);
    if (named >= 0)
        ::unlink(pattern.constData());
    return named;
}
} // namespace

SpillFile::SpillFile(const QString& folder)
{
    const QString path = folder.isEmpty() ? platform::TempFolder::systemPath() : folder;
    m_descriptor = openNameless(QFile::encodeName(path));
    if (m_descriptor < 0)
        spillFailed(QStringLiteral("no scratch file can be made in %1").arg(path), errno);
}

SpillFile::~SpillFile()
{
    if (m_descriptor >= 0)
        ::close(m_descriptor);
}

int64_t SpillFile::append(const QByteArray& bytes)
{
    const int64_t offset = m_size;
    qsizetype written = 0;
    while (written < bytes.size()) {
        const ssize_t n = ::pwrite(m_descriptor, bytes.constData() + written,
            static_cast<size_t>(bytes.size() - written), offset + written);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            spillFailed(
                QStringLiteral("the scratch file cannot be written"), n < 0 ? errno : ENOSPC);
        written += n;
    }
    m_size += written;
    return offset;
}

void SpillFile::read(int64_t offset, qsizetype size, QByteArray& buffer) const
{
    buffer.resize(size);
    qsizetype done = 0;
    while (done < size) {
        const ssize_t n = ::pread(
            m_descriptor, buffer.data() + done, static_cast<size_t>(size - done), offset + done);
        if (n < 0 && errno == EINTR)
            continue;
        if (n <= 0)
            spillFailed(QStringLiteral("the scratch file cannot be read"), n < 0 ? errno : EIO);
        done += n;
    }
}

} // namespace reportrt
