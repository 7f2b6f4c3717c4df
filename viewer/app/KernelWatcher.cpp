#include "viewer/app/KernelWatcher.h"

#include <utility>

#include <QDir>
#include <QFile>
#include <QFileInfo>

namespace viewer {
namespace {

// Period without file events before files are read. Editors write a file in several steps,
// milliseconds apart.
constexpr qint64 kQuietMs = 50;

} // namespace

KernelWatcher::KernelWatcher(const QString& folder) : fFolder(folder)
{
    if (folder.isEmpty())
        return;
    const auto restartTimer = [this] { fSinceChange.start(); };
    QObject::connect(&fWatcher, &QFileSystemWatcher::fileChanged, &fWatcher, restartTimer);
    QObject::connect(&fWatcher, &QFileSystemWatcher::directoryChanged, &fWatcher, restartTimer);
    fWatcher.addPath(folder);
    readFiles();
}

std::vector<ChangedFile> KernelWatcher::changes()
{
    if (!fSinceChange.isValid() || fSinceChange.elapsed() < kQuietMs)
        return {};
    fSinceChange.invalidate();
    return readFiles();
}

// Adds new files, and replaced files, which QFileSystemWatcher no longer watches.
void KernelWatcher::watchFiles()
{
    const QDir folder(fFolder);
    for (const QString& name : folder.entryList({"*.cl"}, QDir::Files)) {
        const QString path = folder.filePath(name);
        if (!fWatcher.files().contains(path))
            fWatcher.addPath(path);
    }
}

std::vector<ChangedFile> KernelWatcher::readFiles()
{
    // Watch before reading, to miss no change in between.
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
