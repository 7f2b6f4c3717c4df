// Notices kernel files that change on the disk.
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

// Watches the files NAME.cl of a folder, also those that an editor replaces by new ones. Needs a
// running event loop; used on its thread.
class KernelWatch {
public:
    // With an empty folder nothing ever changes.
    explicit KernelWatch(const QString& folder);

    // The files whose text is another than when this was last asked. One that is being written is
    // left until the folder has been quiet for a moment. Costs nothing as long as nothing stirs.
    std::vector<ChangedFile> changes();

private:
    void watchFiles();
    // Those that have another text than when they were last read.
    std::vector<ChangedFile> readFiles();

    QString fFolder;
    QFileSystemWatcher fWatcher;
    QElapsedTimer fSinceStir; // valid while something stirred that was not looked at
    std::map<QString, QByteArray> fTexts;
};

} // namespace viewer
