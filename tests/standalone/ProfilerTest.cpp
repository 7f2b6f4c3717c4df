#include "host/Profiler.h"

#include "standalone/ProfileRecorder.h"

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <csignal>
#include <map>
#include <string>
#include <thread>
#include <vector>

#include <sys/resource.h>

namespace {

profiler::EventId begin(const char* name)
{
    return profiler::eventBegin(profiler::categories().main().id(), profiler::Colors::kColor14,
                                name, "", nullptr, 0);
}

// The events of each name, as a viewer would read them from the file. "row" is the name of the row
// that the event is in.
using Trace = std::map<std::string, std::vector<QJsonObject>>;

Trace readTrace()
{
    const QTemporaryDir directory;
    QFile file(directory.filePath("trace.json"));
    EXPECT_TRUE(ProfileRecorder::writeChromeTrace(file.fileName().toStdString()));
    EXPECT_TRUE(file.open(QIODevice::ReadOnly));
    const QJsonDocument document = QJsonDocument::fromJson(file.readAll());
    EXPECT_FALSE(document.isNull()) << "not JSON";
    Trace trace;
    std::map<int, QJsonValue> rows;
    for (const auto& value : document["traceEvents"].toArray()) {
        QJsonObject event = value.toObject();
        const int row = event["tid"].toInt();
        if (event["ph"] == "M" && event["name"] == "thread_name") {
            rows[row] = event["args"].toObject()["name"];
            continue;
        }
        event["row"] = rows[row];
        trace[event["name"].toString().toStdString()].push_back(event);
    }
    return trace;
}

TEST(Profiler, RecordsNothingWhileNotSampling)
{
    EXPECT_FALSE(profiler::samplingActive());
    ProfileRecorder::start();
    EXPECT_TRUE(profiler::samplingActive());
    ProfileRecorder::stop();
    profiler::eventEnd(begin("after"));
    ProfileRecorder::record("track", "after", 1, 2);
    EXPECT_TRUE(readTrace().empty());
}

TEST(Profiler, TraceContainsRecordedEvents)
{
    const std::string name = "\"quoted\" \\ back\nslash \x01 \xc3\xa9";
    ProfileRecorder::start();
    const std::int64_t beforeNs = ProfileRecorder::nowNs();
    // The texts may be destroyed before the trace is written.
    const profiler::EventId id =
        profiler::eventBegin(7, 3, std::string(name).c_str(), "why\t\"so\"", nullptr, 0);
    std::this_thread::sleep_for(std::chrono::milliseconds(2));
    profiler::eventEnd(id);
    const std::int64_t afterNs = ProfileRecorder::nowNs();
    ProfileRecorder::stop();

    const QJsonObject event = readTrace().at(name).front();
    const double start = event["ts"].toDouble();
    const double duration = event["dur"].toDouble();
    EXPECT_EQ(event["ph"], "X");
    EXPECT_EQ(event["cat"], "7");
    EXPECT_EQ(event["args"].toObject(),
              (QJsonObject{{"description", "why\t\"so\""}, {"color", 3}}));
    EXPECT_GE(duration, 2000.0);
    EXPECT_GE(start, static_cast<double>(beforeNs) / 1000.0);
    // Sums of decimal fractions round in the last of their digits; a nanosecond is 0.001.
    EXPECT_LE(start + duration, static_cast<double>(afterNs) / 1000.0 + 0.001);
}

TEST(Profiler, EachThreadHasItsOwnTrack)
{
    constexpr int threadCount = 8;
    constexpr std::size_t eventsPerThread = 2'000;
    ProfileRecorder::start();
    std::vector<std::jthread> threads;
    threads.reserve(threadCount);
    for (int i = 0; i < threadCount; ++i) {
        threads.emplace_back([name = "work" + std::to_string(i)] {
            ProfileRecorder::nameThread("row of " + name);
            for (std::size_t event = 0; event < eventsPerThread; ++event)
                profiler::eventEnd(begin(name.c_str()));
        });
    }
    threads.clear();
    ProfileRecorder::stop();

    const Trace trace = readTrace();
    EXPECT_EQ(trace.size(), std::size_t{threadCount});
    for (const auto& [name, events] : trace) {
        ASSERT_EQ(events.size(), eventsPerThread);
        EXPECT_EQ(events.front()["row"], QString::fromStdString("row of " + name));
        for (const QJsonObject& event : events) {
            EXPECT_EQ(event["ph"], "X");
            EXPECT_EQ(event["tid"], events.front()["tid"]);
        }
    }
}

TEST(Profiler, RecordedTracksAreSeparateWithExactTimes)
{
    ProfileRecorder::start();
    ProfileRecorder::record("queue 1", "copy", 1'000'000'000'001'500, 1'000'000'000'002'750);
    ProfileRecorder::record("queue 2", "kernel", 500, 500);
    std::jthread([] { ProfileRecorder::record("queue 1", "kernel 2", 700, 900); }).join();
    ProfileRecorder::stop();

    const Trace trace = readTrace();
    const QJsonObject copy = trace.at("copy").front();
    const QJsonObject kernel = trace.at("kernel").front();
    EXPECT_DOUBLE_EQ(copy["ts"].toDouble(), 1'000'000'000'001.5);
    EXPECT_DOUBLE_EQ(copy["dur"].toDouble(), 1.25);
    EXPECT_DOUBLE_EQ(kernel["dur"].toDouble(), 0.0);
    EXPECT_EQ(copy["row"], "queue 1");
    EXPECT_EQ(kernel["row"], "queue 2");
    EXPECT_EQ(trace.at("kernel 2").front()["tid"], copy["tid"]);
    EXPECT_NE(kernel["tid"], copy["tid"]);
}

TEST(Profiler, EventEndEndsMatchingEventOrNone)
{
    ProfileRecorder::start();
    const profiler::EventId stale = begin("stale");
    ProfileRecorder::start();
    const profiler::EventId open = begin("open");
    const profiler::EventId crossing = begin("crossing");
    for (const profiler::EventId none : {stale, profiler::EventId{0}, ~profiler::EventId{0}})
        profiler::eventEnd(none);
    std::jthread([crossing] { profiler::eventEnd(crossing); }).join();
    ProfileRecorder::stop();

    const Trace trace = readTrace();
    EXPECT_FALSE(trace.contains("stale"));
    EXPECT_EQ(trace.at("open").front()["ph"], "B") << "never ended";
    EXPECT_EQ(trace.at("crossing").front()["ph"], "X") << "ended by another thread";
    profiler::eventEnd(open);
    EXPECT_EQ(readTrace().at("open").front()["ph"], "X");
}

TEST(Profiler, WriteChromeTraceReportsUnwritableFile)
{
    EXPECT_FALSE(ProfileRecorder::writeChromeTrace("/nonexistent-directory/trace.json"));
    ProfileRecorder::start();
    profiler::eventEnd(begin("event"));
    ProfileRecorder::stop();
    EXPECT_FALSE(ProfileRecorder::writeChromeTrace("/dev/full"));

    // Half of the file fits.
    const QTemporaryDir folder;
    const QString file = folder.filePath("trace.json");
    std::signal(SIGXFSZ, SIG_IGN);
    rlimit before{};
    getrlimit(RLIMIT_FSIZE, &before);
    const rlimit half{20, before.rlim_max};
    setrlimit(RLIMIT_FSIZE, &half);
    std::string reason;
    EXPECT_FALSE(ProfileRecorder::writeChromeTrace(file.toStdString(), &reason));
    setrlimit(RLIMIT_FSIZE, &before);
    EXPECT_EQ(reason, "File too large");
    EXPECT_FALSE(QFile::exists(file));
}

} // namespace
