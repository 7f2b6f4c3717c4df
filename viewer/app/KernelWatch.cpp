#include "viewer/app/KernelWatch.h"

#include <utility>

#include <QDir>
#include <QFile>
#include <QFileInfo>

namespace viewer {
namespace {

// An editor writes a file in several steps, milliseconds apart.
constexpr qint64 kQuietMs = 50;

} // namespace

KernelWatch::KernelWatch(const QString& folder) : fFolder(folder)
{
    if (folder.isEmpty())
        return;
    const auto stir = [this] { fSinceStir.start(); };
    QObject::connect(&fWatcher, &QFileSystemWatcher::fileChanged, &fWatcher, stir);
    QObject::connect(&fWatcher, &QFileSystemWatcher::directoryChanged, &fWatcher, stir);
    fWatcher.addPath(folder);
    readFiles();
}

std::vector<ChangedFile> KernelWatch::changes()
{
    if (!fSinceStir.isValid() || fSinceStir.elapsed() < kQuietMs)
        return {};
    fSinceStir.invalidate();
    return readFiles();
}

// A replaced file is another one for the watcher, which then has given up the path.
void KernelWatch::watchFiles()
{
    const QDir folder(fFolder);
    for (const QString& name : folder.entryList({"*.cl"}, QDir::Files)) {
        const QString path = folder.filePath(name);
        if (!fWatcher.files().contains(path))
            fWatcher.addPath(path);
    }
}

std::vector<ChangedFile> KernelWatch::readFiles()
{
    // Watched before they are read, so that no change falls between.
    watchFiles();
    std::vector<ChangedFile> changed;
    for (const QString& path : fWatcher.files()) {
        QFile file(path);
        if (!file.open(QIODevice::ReadOnly))
            continue;
        const QByteArray text = file.readAll();
        if (std::exchange(fTexts[path], text) != text)
            changed.push_back({QFileInfo(path).fileName().toStdString(), text.toStdString()});
    }
    return changed;
}

} // namespace viewer
