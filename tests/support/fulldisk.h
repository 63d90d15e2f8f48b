#pragma once

// Header only: the runtime's tests and the component's tests over the real runtime both use
// it, and neither links the other's support library.

#include <QFile>
#include <QString>
#include <cerrno>
#include <csignal>
#include <fcntl.h>
#include <sys/mount.h>
#include <sys/resource.h>
#include <unistd.h>

namespace testsupport {

/// Makes writes into a folder fail the way they fail on a full disk, for as long as it
/// lives. Tmpfs mounts a small file system on the folder (the process must be allowed to
/// mount; isReady() says whether it could) and fill() takes its free space; SizeLimit
/// limits the size of every file the process writes (RLIMIT_FSIZE, with SIGXFSZ ignored so
/// write() fails with EFBIG instead of the process being killed) once fill() is called.
/// Files written before fill() keep their content.
class FullDisk {
public:
    enum class Kind { Tmpfs, SizeLimit };

    FullDisk(Kind kind, const QString& folder)
        : m_kind(kind)
        , m_folder(QFile::encodeName(folder))
    {
        if (kind == Kind::Tmpfs)
            m_mounted = ::mount("tmpfs", m_folder.constData(), "tmpfs", MS_NOSUID | MS_NODEV,
                            "size=64k,mode=0700")
                == 0;
    }
    ~FullDisk()
    {
        if (m_limited) {
            ::setrlimit(RLIMIT_FSIZE, &m_previousLimit);
            ::signal(SIGXFSZ, m_previousHandler);
        }
        if (m_mounted)
            ::umount2(m_folder.constData(), MNT_DETACH);
    }
    FullDisk(const FullDisk&) = delete;
    FullDisk& operator=(const FullDisk&) = delete;

    bool isReady() const { return m_kind == Kind::SizeLimit || m_mounted; }

    /// From now on a file grows by at most a few hundred bytes.
    void fill()
    {
        if (m_kind == Kind::SizeLimit) {
            ::getrlimit(RLIMIT_FSIZE, &m_previousLimit);
            m_previousHandler = ::signal(SIGXFSZ, SIG_IGN);
            rlimit limit = m_previousLimit;
            limit.rlim_cur = 512;
            m_limited = ::setrlimit(RLIMIT_FSIZE, &limit) == 0;
            return;
        }
        const QByteArray filler = m_folder + "/filler";
        const int fd = ::open(filler.constData(), O_WRONLY | O_CREAT | O_CLOEXEC, 0600);
        const QByteArray block(512, 'f');
        while (fd >= 0 && ::write(fd, block.constData(), block.size()) > 0) { }
        if (fd >= 0)
            ::close(fd);
    }

private:
    Kind m_kind;
    QByteArray m_folder;
    bool m_mounted = false;
    bool m_limited = false;
    rlimit m_previousLimit {};
    void (*m_previousHandler)(int) = SIG_DFL;
};

} // namespace testsupport
