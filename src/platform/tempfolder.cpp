#include "platform/tempfolder.h"

#include "platform/platformglobal_p.h"

#include <QDir>
#include <QFile>
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

using namespace Qt::StringLiterals;

namespace platform {

namespace {

enum class Check { Private, Missing, Untrusted };

QString systemErrorText(int error)
{
    return QString::fromLocal8Bit(std::strerror(error));
}

[[noreturn]] void raiseAccess(const QString& folder, int error)
{
    detail::raise(detail::PlatformError::PathFileAccess,
        u"Path/File access error: the temporary folder %1 cannot be used (%2)"_s.arg(
            folder, systemErrorText(error)));
}

// Opens the directory without following a link, so the checks and the mode change act on
// exactly the object found at the name and not on whatever a link points to.
Check checkFolder(const QString& folder)
{
    const QByteArray name = QFile::encodeName(folder);
    struct stat linkInfo { };
    if (::lstat(name.constData(), &linkInfo) != 0) {
        if (errno == ENOENT)
            return Check::Missing;
        raiseAccess(folder, errno);
    }
    if (!S_ISDIR(linkInfo.st_mode) || linkInfo.st_uid != ::geteuid())
        return Check::Untrusted;

    const int fd = ::open(name.constData(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    if (fd < 0) {
        if (errno == ENOENT)
            return Check::Missing;
        if (errno == ELOOP || errno == ENOTDIR)
            return Check::Untrusted;
        raiseAccess(folder, errno);
    }
    struct stat info { };
    Check result = Check::Private;
    if (::fstat(fd, &info) != 0) {
        const int error = errno;
        ::close(fd);
        raiseAccess(folder, error);
    }
    if (!S_ISDIR(info.st_mode) || info.st_uid != ::geteuid()) {
        result = Check::Untrusted;
    } else if ((info.st_mode & 07777) != 0700) {
        qCWarning(lcPlatform, "Temporary folder %ls had mode %o; narrowing it to 0700",
            qUtf16Printable(folder), static_cast<unsigned>(info.st_mode & 07777));
        if (::fchmod(fd, 0700) != 0) {
            const int error = errno;
            ::close(fd);
            raiseAccess(folder, error);
        }
    }
    ::close(fd);
    return result;
}

// Creates the folder when missing; returns whether the folder now at that name is private.
bool ensurePrivate(const QString& folder)
{
    for (int attempt = 0; attempt < 3; ++attempt) {
        switch (checkFolder(folder)) {
        case Check::Private:
            return true;
        case Check::Untrusted:
            return false;
        case Check::Missing:
            // mkdir honours the umask, so the mode is checked (and fixed) on the next round.
            if (::mkdir(QFile::encodeName(folder).constData(), 0700) != 0 && errno != EEXIST)
                raiseAccess(folder, errno);
            break;
        }
    }
    // Something keeps removing the folder between our steps.
    raiseAccess(folder, EAGAIN);
}

bool isAsciiLetter(QChar c)
{
    return (c >= u'a' && c <= u'z') || (c >= u'A' && c <= u'Z');
}

const TempFolder& systemFolder()
{
    static const TempFolder folder;
    return folder;
}

QString makeUniqueFolder(const QString& baseDirectory)
{
    QByteArray pattern = QFile::encodeName(
        baseDirectory + u"/ludmox-%1-XXXXXX"_s.arg(static_cast<qulonglong>(::geteuid())));
    if (::mkdtemp(pattern.data()) == nullptr)
        raiseAccess(baseDirectory, errno);
    return QFile::decodeName(pattern);
}

} // namespace

TempFolder::TempFolder(const QString& baseDirectory)
    : m_baseDirectory(QDir::cleanPath(
        QDir(baseDirectory.isEmpty() ? QDir::tempPath() : baseDirectory).absolutePath()))
{ }

QString TempFolder::path() const
{
    if (!m_folder.isEmpty() && ensurePrivate(m_folder))
        return m_folder + u'/';

    const QString preferred
        = m_baseDirectory + u"/ludmox-%1"_s.arg(static_cast<qulonglong>(::geteuid()));
    if (ensurePrivate(preferred)) {
        m_folder = preferred;
    } else {
        qCWarning(lcPlatform,
            "%ls is not a private folder of this user; using a new folder instead",
            qUtf16Printable(preferred));
        m_folder = makeUniqueFolder(m_baseDirectory);
    }
    return m_folder + u'/';
}

QString TempFolder::systemPath()
{
    return systemFolder().path();
}

QString TempFolder::scratchPath(const QString& path) const
{
    const bool hasDrive = path.size() >= 2 && path.at(1) == u':' && isAsciiLetter(path.at(0));
    if (!hasDrive && !path.startsWith(u'\\'))
        return path;
    QString name = path.mid(hasDrive ? 2 : 0);
    name = name.mid(std::max(name.lastIndexOf(u'\\'), name.lastIndexOf(u'/')) + 1);
    // "c:\.." must not climb out of the folder.
    if (name == u"."_s || name == u".."_s)
        name.clear();
    return this->path() + name;
}

QString TempFolder::systemScratchPath(const QString& path)
{
    return systemFolder().scratchPath(path);
}

} // namespace platform
