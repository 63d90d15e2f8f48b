#include <QDir>
#include <QFile>
#include <QTemporaryDir>
#include <core/comerror.h>
#include <gtest/gtest.h>
#include <platform/tempfolder.h>
#include <sys/stat.h>
#include <unistd.h>

using namespace Qt::StringLiterals;

namespace {

struct FolderState {
    bool isRealDirectory = false;
    uid_t owner = 0;
    mode_t mode = 0;
};

FolderState stateOf(const QString& path)
{
    FolderState state;
    struct stat info { };
    if (::lstat(QFile::encodeName(path).constData(), &info) == 0) {
        state.isRealDirectory = S_ISDIR(info.st_mode);
        state.owner = info.st_uid;
        state.mode = info.st_mode & 07777;
    }
    return state;
}

QString preferredFolder(const QTemporaryDir& base)
{
    return base.path() + u"/ludmox-%1"_s.arg(static_cast<qulonglong>(::geteuid()));
}

void expectPrivate(const QString& path)
{
    ASSERT_TRUE(path.endsWith(u'/')) << path.toStdString();
    const FolderState state = stateOf(path.chopped(1));
    EXPECT_TRUE(state.isRealDirectory) << path.toStdString();
    EXPECT_EQ(state.owner, ::geteuid());
    EXPECT_EQ(state.mode, 0700u);
}

class UmaskGuard {
public:
    explicit UmaskGuard(mode_t mask)
        : m_previous(::umask(mask))
    { }
    ~UmaskGuard() { ::umask(m_previous); }

private:
    mode_t m_previous;
};

TEST(TempFolder, IsCreatedPrivateWhateverTheUmask)
{
    // mkdir applies the umask: 0777 would give a folder nobody can enter, 0 one anyone can.
    for (const mode_t mask : { mode_t(022), mode_t(0), mode_t(0777) }) {
        SCOPED_TRACE(mask);
        QTemporaryDir base;
        QString path;
        {
            UmaskGuard guard(mask);
            path = platform::TempFolder(base.path()).path();
        }
        EXPECT_EQ(path, preferredFolder(base) + u'/');
        expectPrivate(path);
    }
}

TEST(TempFolder, NarrowsTheModeOfTheUsersOwnFolder)
{
    for (const mode_t mode : { mode_t(0755), mode_t(0777), mode_t(01777), mode_t(0500) }) {
        SCOPED_TRACE(mode);
        QTemporaryDir base;
        const QString folder = preferredFolder(base);
        ASSERT_TRUE(QDir().mkdir(folder));
        QFile kept(folder + u"/kept.txt"_s);
        ASSERT_TRUE(kept.open(QIODevice::WriteOnly));
        kept.close();
        ASSERT_EQ(::chmod(QFile::encodeName(folder).constData(), mode), 0);

        const QString path = platform::TempFolder(base.path()).path();

        EXPECT_EQ(path, folder + u'/');
        expectPrivate(path);
        EXPECT_TRUE(QFile::exists(folder + u"/kept.txt"_s));
    }
}

TEST(TempFolder, IsRecreatedWhenRemoved)
{
    QTemporaryDir base;
    const platform::TempFolder folder(base.path());
    const QString first = folder.path();
    ASSERT_TRUE(QDir(first).removeRecursively());

    EXPECT_EQ(folder.path(), first);
    expectPrivate(first);
}

// Something else at the folder's name is never used, followed or changed; a fresh private
// folder takes its place.
class TempFolderSquatted : public ::testing::Test {
protected:
    void expectFreshFolder()
    {
        const QString path = platform::TempFolder(base.path()).path();
        EXPECT_NE(path, preferredFolder(base) + u'/');
        EXPECT_TRUE(path.startsWith(base.path() + u'/')) << path.toStdString();
        expectPrivate(path);
    }

    QTemporaryDir base;
};

TEST_F(TempFolderSquatted, BySymbolicLink)
{
    QTemporaryDir target;
    ASSERT_EQ(::chmod(QFile::encodeName(target.path()).constData(), 0755), 0);
    ASSERT_TRUE(QFile::link(target.path(), preferredFolder(base)));

    expectFreshFolder();
    EXPECT_EQ(stateOf(target.path()).mode, 0755u);
    EXPECT_TRUE(QFileInfo(preferredFolder(base)).isSymLink());
}

TEST_F(TempFolderSquatted, ByFile)
{
    QFile file(preferredFolder(base));
    ASSERT_TRUE(file.open(QIODevice::WriteOnly));
    file.write("x");
    file.close();

    expectFreshFolder();
    EXPECT_EQ(QFileInfo(preferredFolder(base)).size(), 1);
}

TEST_F(TempFolderSquatted, ByAnotherUsersFolder)
{
    if (::geteuid() != 0)
        GTEST_SKIP() << "only root can make a folder of another user";
    const QString folder = preferredFolder(base);
    ASSERT_TRUE(QDir().mkdir(folder));
    ASSERT_EQ(::chmod(QFile::encodeName(folder).constData(), 0777), 0);
    ASSERT_EQ(::chown(QFile::encodeName(folder).constData(), 65534, 65534), 0);

    expectFreshFolder();
    EXPECT_EQ(stateOf(folder).mode, 0777u);
    EXPECT_EQ(stateOf(folder).owner, 65534u);
}

TEST(TempFolder, MissingBaseDirectoryRaisesPathFileAccess)
{
    QTemporaryDir base;
    try {
        platform::TempFolder(base.path() + u"/does/not/exist"_s).path();
        FAIL() << "no error raised";
    } catch (const core::ComError& error) {
        EXPECT_EQ(error.number(), 75);
        EXPECT_TRUE(error.description().contains(u"does/not/exist"_s));
    }
}

TEST(TempFolder, PathsOfTheOriginalPlatformMapIntoTheFolder)
{
    QTemporaryDir base;
    const platform::TempFolder folder(base.path());
    const QString inside = preferredFolder(base) + u'/';
    const struct {
        const char* name;
        QString given;
        QString expected; // in the folder; the same as `given` when the path is kept
    } cases[] = {
        { "drive root", u"c:\\ludmox.log"_s, u"ludmox.log"_s },
        { "upper-case drive, forward slash", u"D:/out.pdf"_s, u"out.pdf"_s },
        { "drive without a separator", u"c:scratch.tmp"_s, u"scratch.tmp"_s },
        { "folders on a drive", u"c:\\temp\\sub/report.xls"_s, u"report.xls"_s },
        { "rooted without a drive", u"\\ludmox.log"_s, u"ludmox.log"_s },
        { "share", u"\\\\server\\share\\mail.eml"_s, u"mail.eml"_s },
        { "the root itself", u"c:\\"_s, QString() },
        // Must not climb out of the private folder.
        { "parent folder", u"c:\\.."_s, QString() },
        { "current folder", u"\\."_s, QString() },
        { "a path of this system", u"/var/tmp/x.log"_s, u"/var/tmp/x.log"_s },
        { "a relative path", u"trace.log"_s, u"trace.log"_s },
        { "a digit is no drive", u"1:\\x.log"_s, u"1:\\x.log"_s },
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.name);
        const bool unchanged = c.expected == c.given;
        EXPECT_EQ(folder.scratchPath(c.given), unchanged ? c.given : inside + c.expected);
    }
    expectPrivate(inside);
}

TEST(TempFolder, TheProcessFolderTakesTheDefaultTraceFile)
{
    const QString path = platform::TempFolder::systemScratchPath(u"c:\\ludmox.log"_s);
    EXPECT_EQ(path, platform::TempFolder::systemPath() + u"ludmox.log"_s);
    EXPECT_FALSE(path.startsWith(u"/ludmox"_s));
}

} // namespace
