#include "viewer/system/FileOutput.h"

#include <QFile>
#include <QFileInfo>

namespace viewer {
namespace {

// Continues after a short write, because only the next write reports the reason.
[[nodiscard]] bool writeAll(QFile& file, const QByteArray& content)
{
    qint64 written = 0;
    while (written < content.size()) {
        const qint64 more = file.write(content.constData() + written, content.size() - written);
        if (more <= 0)
            return false;
        written += more;
    }
    return file.flush();
}

} // namespace

std::optional<std::string> writeFile(const std::string& path, const QByteArray& content)
{
    QFile file(QString::fromStdString(path));
    if (file.open(QIODevice::WriteOnly | QIODevice::Unbuffered) && writeAll(file, content))
        return std::nullopt;
    std::string reason = file.errorString().toStdString();
    file.close();
    if (QFileInfo(file).isFile())
        file.remove();
    return reason;
}

} // namespace viewer
