// Detects kernel files that change on disk.
#pragma once

#include <map>
#include <string>
#include <vector>

#include <QByteArray>
#include <QElapsedTimer>
#include <QFileSystemWatcher>
#include <QString>

namespace viewer {

struct ChangedFile {
    std::string name; // without the folder
    std::string text;
};

// Watches the files *.cl of a folder, including files that an editor replaces. Needs a running
// event loop in its thread.
class KernelWatcher {
public:
    // An empty `folder` never changes.
    explicit KernelWatcher(const QString& folder);

    // Returns the files whose text has changed since the last call or the construction. Waits for a
    // short period without file events before it reads, since a file may still be being written.
    // Cheap if nothing has changed.
    [[nodiscard]] std::vector<ChangedFile> changes();

private:
    void watchFiles();
    std::vector<ChangedFile> readFiles();

    QString fFolder;
    QFileSystemWatcher fWatcher;
    QElapsedTimer fSinceChange; // since the last file event; invalid if changes() has handled it
    std::map<QString, QByteArray> fTexts;
};

} // namespace viewer
