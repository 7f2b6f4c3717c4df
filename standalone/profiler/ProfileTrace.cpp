// Writes the profiler's events as Chrome trace-event JSON ("Trace Event Format").
#include "standalone/ProfileRecorder.h"
#include "standalone/profiler/ProfileLog.h"

#include <QFile>
#include <QFileInfo>
#include <QJsonDocument>
#include <QJsonObject>
#include <QString>

#include <map>
#include <set>
#include <string>
#include <utility>

namespace {

using vyra::host::ProfileEvent;
using vyra::host::ThreadProfile;

// All rows are of one process. Tracks are rows, too, with numbers after those of threads.
constexpr int kProcessId = 1;
constexpr int kFirstTrackRow = 1'000'000;

double microseconds(std::int64_t nanoseconds)
{
    return static_cast<double>(nanoseconds) / 1000.0;
}

QString categoryName(std::uint32_t id)
{
    return id == vyra::host::kMainCategoryId ? QStringLiteral("main") : QString::number(id);
}

QJsonObject eventObject(const ProfileEvent& event, int row)
{
    QJsonObject object{{"name", QString::fromUtf8(event.name.asChar())},
                       {"cat", categoryName(event.categoryId)},
                       {"pid", kProcessId},
                       {"tid", row},
                       {"ts", microseconds(event.beginNs)}};
    if (event.endNs == vyra::host::kStillOpen) {
        object["ph"] = "B";
    } else {
        object["ph"] = "X";
        object["dur"] = microseconds(event.endNs - event.beginNs);
    }
    QJsonObject arguments{{"color", static_cast<qint64>(event.color)}};
    if (*event.description.asChar() != '\0') {
        arguments["description"] = QString::fromUtf8(event.description.asChar());
    }
    object["args"] = arguments;
    return object;
}

QJsonObject rowName(const std::string& name, int row)
{
    return {{"name", "thread_name"},
            {"ph", "M"},
            {"pid", kProcessId},
            {"tid", row},
            {"args", QJsonObject{{"name", QString::fromStdString(name)}}}};
}

// Writes objects as elements of the file's only array, one per line.
class TraceFile {
public:
    explicit TraceFile(const std::string& path) : fFile(QString::fromStdString(path))
    {
        fGood = fFile.open(QIODevice::WriteOnly | QIODevice::Truncate | QIODevice::Unbuffered);
        write("{\"traceEvents\":[");
    }

    void add(const QJsonObject& object)
    {
        write(std::exchange(fSeparator, ",\n"));
        write(QJsonDocument(object).toJson(QJsonDocument::Compact));
    }

    // Returns whether everything was written. If not, removes the file unless it is a device.
    bool finish()
    {
        write("\n]}\n");
        fGood = fGood && writeContent();
        fReason = fFile.errorString().toStdString();
        fFile.close();
        if (!fGood && QFileInfo(fFile).isFile()) {
            fFile.remove();
        }
        return fGood;
    }

    // The system's message if finish returned false.
    const std::string& reason() const { return fReason; }

private:
    void write(const QByteArray& bytes) { fContent += bytes; }

    // A write that is cut short gets its reason from the system only when it is continued.
    bool writeContent()
    {
        qint64 written = 0;
        while (written < fContent.size()) {
            const qint64 more =
                fFile.write(fContent.constData() + written, fContent.size() - written);
            if (more <= 0) {
                return false;
            }
            written += more;
        }
        return true;
    }

    QFile fFile;
    QByteArray fContent;
    std::string fReason;
    const char* fSeparator = "\n";
    bool fGood = false;
};

// Assigns a row to every thread and track with events, and writes its name before its first event.
class RowTable {
public:
    explicit RowTable(TraceFile& file) : fFile(file) {}

    int row(const ProfileEvent& event, const std::string& threadName, int threadRow)
    {
        const std::string track = event.track.asChar();
        if (track.empty()) {
            return named(threadRow, threadName);
        }
        const int newRow = kFirstTrackRow + static_cast<int>(fTracks.size());
        return named(fTracks.try_emplace(track, newRow).first->second, track);
    }

private:
    int named(int row, const std::string& name)
    {
        if (fNamed.insert(row).second) {
            fFile.add(rowName(name, row));
        }
        return row;
    }

    TraceFile& fFile;
    std::map<std::string, int> fTracks;
    std::set<int> fNamed;
};

} // namespace

bool ProfileRecorder::writeChromeTrace(const std::string& path, std::string* reason)
{
    TraceFile file(path);
    RowTable rows(file);
    int threadRow = 0;
    for (const ThreadProfile& thread : vyra::host::ProfileLog::copyAll()) {
        ++threadRow;
        for (const ProfileEvent& event : thread.events) {
            file.add(eventObject(event, rows.row(event, thread.threadName, threadRow)));
        }
    }
    const bool written = file.finish();
    if (!written && reason) {
        *reason = file.reason();
    }
    return written;
}
