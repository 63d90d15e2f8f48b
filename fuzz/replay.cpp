// Replays fuzz inputs through a fuzz target without libFuzzer: every file named on the
// command line, or found in a directory named there, is passed once. Used by CTest to run
// the corpora with any compiler.

#include <QByteArray>
#include <QDirIterator>
#include <QFile>
#include <QFileInfo>
#include <QStringList>
#include <cstddef>
#include <cstdint>
#include <cstdio>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

int main(int argc, char** argv)
{
    QStringList files;
    for (int i = 1; i < argc; ++i) {
        const QString path = QString::fromLocal8Bit(argv[i]);
        if (QFileInfo(path).isDir()) {
            QDirIterator it(path, QDir::Files, QDirIterator::Subdirectories);
            while (it.hasNext())
                files << it.next();
        } else {
            files << path;
        }
    }
    files.sort();
    int failed = 0;
    for (const QString& path : files) {
        QFile file(path);
        if (!file.open(QIODevice::ReadOnly)) {
            std::fprintf(stderr, "cannot read %s\n", qPrintable(path));
            ++failed;
            continue;
        }
        const QByteArray data = file.readAll();
        LLVMFuzzerTestOneInput(
            reinterpret_cast<const uint8_t*>(data.constData()), static_cast<size_t>(data.size()));
    }
    std::printf("%lld passed, %d failed\n", static_cast<long long>(files.size() - failed), failed);
    return failed == 0 && !files.isEmpty() ? 0 : 1;
}
