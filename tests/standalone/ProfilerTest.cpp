#include "host/Profiler.h"

#include "standalone/ProfileRecorder.h"

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <string>
#include <thread>
#include <vector>

namespace {

profiler::EventId begin(const char* name)
{
    return profiler::eventBegin(profiler::categories().main().id(), profiler::Colors::kColor14,
                                name, "", nullptr, 0);
}

// What was recorded, read back from the file as a viewer would.
class Trace {
public:
    static Trace read()
    {
        const QTemporaryDir directory;
        const QString path = directory.filePath("trace.json");
        EXPECT_TRUE(ProfileRecorder::writeChromeTrace(path.toStdString()));
        QFile file(path);
        EXPECT_TRUE(file.open(QIODevice::ReadOnly));
        QJsonParseError error;
        const QJsonDocument document = QJsonDocument::fromJson(file.readAll(), &error);
        EXPECT_EQ(error.error, QJsonParseError::NoError) << error.errorString().toStdString();
        Trace trace;
        for (const auto& value : document.object()["traceEvents"].toArray()) {
            trace.fObjects.push_back(value.toObject());
        }
        return trace;
    }

    // All events of that name, row names left out.
    std::vector<QJsonObject> events(const QString& name) const
    {
        std::vector<QJsonObject> found;
        for (const QJsonObject& object : fObjects) {
            if (object["ph"] != "M" && object["name"] == name) {
                found.push_back(object);
            }
        }
        return found;
    }

    // The one event of that name; an empty object when there is another number of them.
    QJsonObject event(const QString& name) const
    {
        const std::vector<QJsonObject> found = events(name);
        EXPECT_EQ(found.size(), 1u) << name.toStdString();
        return found.size() == 1 ? found.front() : QJsonObject();
    }

    QString rowName(const QJsonObject& event) const
    {
        for (const QJsonObject& object : fObjects) {
            if (object["ph"] == "M" && object["name"] == "thread_name" &&
                object["tid"] == event["tid"]) {
                return object["args"].toObject()["name"].toString();
            }
        }
        return {};
    }

    std::size_t size() const { return fObjects.size(); }

private:
    std::vector<QJsonObject> fObjects;
};

double start(const QJsonObject& event)
{
    return event["ts"].toDouble();
}

double end(const QJsonObject& event)
{
    return start(event) + event["dur"].toDouble();
}

TEST(Profiler, RecordsNothingWhileNotSampling)
{
    EXPECT_FALSE(profiler::samplingActive());
    profiler::eventEnd(begin("before"));
    ProfileRecorder::record("track", "before", 1, 2);
    ProfileRecorder::start();
    EXPECT_TRUE(profiler::samplingActive());
    ProfileRecorder::stop();
    profiler::eventEnd(begin("after"));
    EXPECT_EQ(Trace::read().size(), 0u);
}

TEST(Profiler, WritesNestedEventsInsideTheirParents)
{
    ProfileRecorder::start();
    const std::int64_t beforeNs = ProfileRecorder::nowNs();
    const profiler::EventId outer = begin("outer");
    const profiler::EventId inner = begin("inner");
    std::this_thread::sleep_for(std::chrono::milliseconds(2));
    profiler::eventEnd(inner);
    profiler::eventEnd(outer);
    const std::int64_t afterNs = ProfileRecorder::nowNs();
    ProfileRecorder::stop();

    const Trace trace = Trace::read();
    const QJsonObject outerEvent = trace.event("outer");
    const QJsonObject innerEvent = trace.event("inner");
    EXPECT_EQ(outerEvent["ph"], "X");
    EXPECT_EQ(outerEvent["tid"], innerEvent["tid"]);
    EXPECT_GE(innerEvent["dur"].toDouble(), 2000.0);
    EXPECT_GE(start(outerEvent), static_cast<double>(beforeNs) / 1000.0);
    EXPECT_LE(start(outerEvent), start(innerEvent));
    // Sums of decimal fractions round in the last of their digits; a nanosecond is 0.001.
    EXPECT_LE(end(innerEvent), end(outerEvent) + 0.001);
    EXPECT_LE(end(outerEvent), static_cast<double>(afterNs) / 1000.0 + 0.001);
}

TEST(Profiler, KeepsEveryEventOfEveryThreadInARowOfItsOwn)
{
    constexpr int threadCount = 8;
    constexpr std::size_t eventsPerThread = 2'000;
    ProfileRecorder::start();
    {
        std::vector<std::jthread> threads;
        threads.reserve(threadCount);
        for (int i = 0; i < threadCount; ++i) {
            threads.emplace_back([i] {
                const std::string name = "work" + std::to_string(i);
                ProfileRecorder::nameThread("worker " + std::to_string(i));
                for (std::size_t event = 0; event < eventsPerThread; ++event) {
                    profiler::eventEnd(begin(name.c_str()));
                }
            });
        }
    }
    ProfileRecorder::stop();

    const Trace trace = Trace::read();
    for (int i = 0; i < threadCount; ++i) {
        const std::vector<QJsonObject> events = trace.events("work" + QString::number(i));
        ASSERT_EQ(events.size(), eventsPerThread);
        EXPECT_EQ(trace.rowName(events.front()), "worker " + QString::number(i));
        for (const QJsonObject& event : events) {
            EXPECT_EQ(event["ph"], "X");
            EXPECT_EQ(event["tid"], events.front()["tid"]);
        }
    }
}

TEST(Profiler, KeepsTracksApartAndTheirTimesExact)
{
    ProfileRecorder::start();
    ProfileRecorder::record("queue 1", "copy", 1'000'000'000'001'500, 1'000'000'000'002'750);
    ProfileRecorder::record("queue 2", "kernel", 500, 500);
    std::jthread([] { ProfileRecorder::record("queue 1", "kernel 2", 700, 900); }).join();
    ProfileRecorder::stop();

    const Trace trace = Trace::read();
    const QJsonObject copy = trace.event("copy");
    EXPECT_DOUBLE_EQ(start(copy), 1'000'000'000'001.5);
    EXPECT_DOUBLE_EQ(copy["dur"].toDouble(), 1.25);
    EXPECT_DOUBLE_EQ(trace.event("kernel")["dur"].toDouble(), 0.0);
    EXPECT_EQ(trace.rowName(copy), "queue 1");
    EXPECT_EQ(trace.rowName(trace.event("kernel")), "queue 2");
    EXPECT_EQ(trace.event("kernel 2")["tid"], copy["tid"]);
    EXPECT_NE(trace.event("kernel")["tid"], copy["tid"]);
}

TEST(Profiler, EndsTheRightEventOrNone)
{
    ProfileRecorder::start();
    const profiler::EventId stale = begin("stale");
    ProfileRecorder::start();
    const profiler::EventId open = begin("open");
    const profiler::EventId crossing = begin("crossing");
    profiler::eventEnd(stale);
    profiler::eventEnd(0);
    profiler::eventEnd(~profiler::EventId{0});
    std::jthread([crossing] { profiler::eventEnd(crossing); }).join();
    ProfileRecorder::stop();

    const Trace trace = Trace::read();
    EXPECT_TRUE(trace.events("stale").empty());
    EXPECT_EQ(trace.event("open")["ph"], "B") << "never ended";
    EXPECT_EQ(trace.event("crossing")["ph"], "X") << "ended by another thread";
    profiler::eventEnd(open);
    EXPECT_EQ(Trace::read().event("open")["ph"], "X");
}

TEST(Profiler, EscapesTexts)
{
    const QString name = QString::fromUtf8("\"quoted\" \\ back\nslash \x01 \xc3\xa9");
    ProfileRecorder::start();
    {
        // The texts may go before the trace is written.
        const std::string text = name.toStdString();
        profiler::eventEnd(profiler::eventBegin(7, 3, text.c_str(), "why\t\"so\"", nullptr, 0));
    }
    ProfileRecorder::stop();

    const QJsonObject event = Trace::read().event(name);
    EXPECT_EQ(event["args"].toObject()["description"], "why\t\"so\"");
    EXPECT_EQ(event["args"].toObject()["color"], 3);
    EXPECT_EQ(event["cat"], "7");
}

TEST(Profiler, SaysWhenTheFileCannotBeWritten)
{
    EXPECT_FALSE(ProfileRecorder::writeChromeTrace("/nonexistent-directory/trace.json"));
    ProfileRecorder::start();
    profiler::eventEnd(begin("event"));
    ProfileRecorder::stop();
    EXPECT_FALSE(ProfileRecorder::writeChromeTrace("/dev/full"));
}

} // namespace
