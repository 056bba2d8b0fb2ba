// The agent library as its users link it, over a described host.
#include "agent/OrvAgentControl.h"
#include "instrumentation/Instrumentation.h"
#include "instrumentation/LumLog.h"
#include "instrumentation/Utilities.h"
#include "tests/agent/TemporaryFile.h"

#include <atomic>
#include <thread>
#include <type_traits>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace {

using namespace Orv::NodeLexicon;
using LumLog::LumLogger;
using LumLog::LumMessageBuffer;
using Orv::Instrumentation;
using Orv::Test::messageOf;
using Orv::Test::TemporaryFile;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::StartsWith;

static_assert(!std::is_copy_constructible_v<Instrumentation>);

/** The back end is one per process, and so is its file; each test gives it another content. */
const TemporaryFile& treeFile() {
    static const TemporaryFile file("lab.toml", "");
    return file;
}

const TemporaryFile& logFile() {
    static const TemporaryFile file("marlo.log", "");
    return file;
}

const TemporaryFile& traceFile() {
    static const TemporaryFile file("marlo.trace", "");
    return file;
}

class Environment : public testing::Environment {
  public:
    void SetUp() override {
        const TemporaryFile configuration("agent.toml", "");
        ::setenv("ORV_AGENT_CONFIG", configuration.path().c_str(), 1);
        ::setenv("ORV_AGENT_TREE", treeFile().path().c_str(), 1);
        ::setenv("ORV_AGENT_LOG_SINKS", ("file:" + logFile().path()).c_str(), 1);
        ::setenv("ORV_AGENT_TRACE_LEVEL", "4000", 1);
        ::setenv("ORV_AGENT_TRACE_SINKS", ("file:" + traceFile().path()).c_str(), 1);
        const Instrumentation first; // reads the configuration while its file is there
    }
};

const auto* const environment = testing::AddGlobalTestEnvironment(std::make_unique<Environment>().release());

std::string identityOf(Instrumentation& cursor) {
    std::string identity = "absent";
    cursor.getProperty(PROP_NODE_STRING, identity);
    return identity;
}

std::vector<std::string> scan(NodeType type = NODE_NETWORK_ADAPTER) {
    std::vector<std::string> identities;
    Instrumentation cursor;
    for (cursor.selectNode(type); cursor; ++cursor) {
        identities.push_back(identityOf(cursor));
    }
    return identities;
}

std::string grandparentOf(Instrumentation& cursor) {
    Instrumentation climber;
    climber.selectNode(cursor.getPathToParentNode());
    climber.selectNode(climber.getPathToParentNode());
    return climber.getNodeDescription();
}

TEST(InstrumentationLibrary, ScansAdaptersAndPorts) {
    treeFile().write("[[adapter]]\nidentity = \"eth1\"\n[[adapter]]\nidentity = \"eth0\"\n");
    EXPECT_THAT(scan(), ElementsAre("eth1", "eth0"));
    EXPECT_THAT(scan(NODE_NETWORK_PORT), ElementsAre("eth1", "eth0"));
}

TEST(InstrumentationLibrary, IsFalseAtOnceWithoutAdapters) {
    treeFile().write("");
    Instrumentation cursor;
    EXPECT_FALSE(cursor);
    cursor.selectNode(NODE_NETWORK_ADAPTER);
    EXPECT_FALSE(cursor);
    EXPECT_EQ(cursor.getNodeDescription(), "");
    EXPECT_EQ(cursor.getPathToParentNode(), "");
}

TEST(InstrumentationLibrary, ReadsValuesOfEachType) {
    treeFile().write("[[adapter]]\nstatus = 65537\nipv4_address = \"192.0.2.1\"\ndns_servers = [\"b\", \"a\"]\n");
    Instrumentation cursor;
    cursor.selectNode(NODE_NETWORK_ADAPTER);
    unsigned int status = 0;
    std::string address;
    std::vector<std::string> servers{"stale"};
    EXPECT_TRUE(cursor.getProperty(PROP_STATUS, status));
    EXPECT_TRUE(cursor.getProperty(PROP_IPV4_ADDRESS, address));
    EXPECT_TRUE(cursor.getProperty(PROP_DNS_SERVERS, servers));
    EXPECT_EQ(status, 65537U);
    EXPECT_EQ(address, "192.0.2.1");
    EXPECT_THAT(servers, ElementsAre("b", "a"));
    EXPECT_FALSE(cursor.getProperty(PROP_DHCP_ENABLED, status));
    EXPECT_EQ(status, 65537U);
}

TEST(InstrumentationLibrary, ClimbsToTheGrandparent) {
    treeFile().write("[[adapter]]\nidentity = \"usb0\"\nchassis = \"BMC\"\n[[adapter]]\nidentity = \"eth0\"\n");
    Instrumentation cursor;
    cursor.selectNode(NODE_NETWORK_ADAPTER);
    EXPECT_EQ(grandparentOf(cursor), "BMC");
    ++cursor;
    EXPECT_EQ(grandparentOf(cursor), "Chassis");
}

TEST(InstrumentationLibrary, ClimbsThoughTheFileHasVanishedSince) {
    treeFile().write("[[adapter]]\nidentity = \"usb0\"\nchassis = \"BMC\"\n");
    Instrumentation cursor;
    cursor.selectNode(NODE_NETWORK_ADAPTER);
    treeFile().remove();
    EXPECT_EQ(grandparentOf(cursor), "BMC");
}

TEST(InstrumentationLibrary, ThrowsAndLogsWhyATreeCannotBeRead) {
    treeFile().write("[[adapter]]\nstatus = \"up\"\n");
    const std::string why =
        treeFile().path() + ":2: adapter.status: expected an integer from 0 to 4294967295, found a string";
    logFile().write("");
    EXPECT_EQ(messageOf([] { scan(); }), why);
    EXPECT_THAT(logFile().read(), HasSubstr(" error [Hearth.Agent] " + why + "\n"));
    treeFile().write("[[adapter]]\nidentity = \"eth0\"\n");
    EXPECT_THAT(scan(), ElementsAre("eth0"));
}

TEST(InstrumentationLibrary, ThrowsAndLogsWhyAWriteCannotBeDone) {
    treeFile().write("[[adapter]]\nidentity = \"eth0\"\n");
    Instrumentation cursor;
    cursor.selectNode(NODE_NETWORK_ADAPTER);
    std::string address = "192.0.2.256";
    unsigned int mode = 2;
    logFile().write("");
    EXPECT_THAT(messageOf([&] { cursor.setProperty(PROP_IPV4_ADDRESS, address); }),
                StartsWith("eth0: IPv4Address cannot be set to \"192.0.2.256\": "));
    EXPECT_THAT(messageOf([&] { cursor.setProperty(PROP_DHCP_ENABLED, mode); }),
                StartsWith("eth0: DHCPEnabled cannot be set to 2: "));
    EXPECT_THAT(messageOf([&] { cursor.setProperty(PROP_DNS_SERVERS, std::vector<std::string>{"a"}); }),
                StartsWith("eth0: DNSServerSearchOrder cannot be set to [\"a\"]: "));
    EXPECT_THAT(logFile().read(), HasSubstr("DNSServerSearchOrder cannot be set"));
    EXPECT_EQ(treeFile().read(), "[[adapter]]\nidentity = \"eth0\"\n");
}

TEST(InstrumentationLibrary, ReadsWhatItHasWritten) {
    treeFile().write("[[adapter]]\nidentity = \"eth0\"\n");
    std::string address = "192.0.2.1";
    unsigned int mode = 3;
    Instrumentation writer;
    writer.selectNode(NODE_NETWORK_ADAPTER);
    writer.setProperty(PROP_DHCP_ENABLED, mode);
    writer.setProperty(PROP_IPV4_ADDRESS, address);
    writer.setProperty(PROP_DNS_SERVERS, std::vector<std::string>{"192.0.2.53", "192.0.2.54"});
    Instrumentation reader;
    reader.selectNode(NODE_NETWORK_ADAPTER);
    std::string text;
    std::vector<std::string> list;
    EXPECT_TRUE(reader.getProperty(PROP_IPV4_ADDRESS, text));
    EXPECT_EQ(text, "192.0.2.1");
    EXPECT_TRUE(reader.getProperty(PROP_DNS_SERVERS, list));
    EXPECT_THAT(list, ElementsAre("192.0.2.53", "192.0.2.54"));
}

TEST(InstrumentationLibrary, MonitorsNothingWithoutACallback) {
    Instrumentation cursor;
    EXPECT_THAT(messageOf([&] { cursor.startMonitoring(NODE_NETWORK_ADAPTER, nullptr, nullptr); }),
                HasSubstr("without a callback"));
    EXPECT_NO_THROW(cursor.stopMonitoring(NODE_NETWORK_ADAPTER, nullptr, nullptr));
}

TEST(InstrumentationLibrary, ServesThreadsWithCursorsOfTheirOwnWhileTheHostChanges) {
    treeFile().replace("[[adapter]]\nidentity = \"eth0\"\nchassis = \"A\"\n");
    std::atomic<bool> isDone{false};
    std::atomic<int> mixed{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            while (!isDone) {
                Instrumentation cursor;
                cursor.selectNode(NODE_NETWORK_ADAPTER);
                const std::string expected = identityOf(cursor) == "eth0" ? "A" : "B";
                mixed += grandparentOf(cursor) == expected ? 0 : 1;
            }
        });
    }
    for (int i = 0; i < 40; ++i) {
        treeFile().replace(i % 2 == 0 ? "[[adapter]]\nidentity = \"eth1\"\nchassis = \"B\"\n"
                                      : "[[adapter]]\nidentity = \"eth0\"\nchassis = \"A\"\n");
    }
    isDone = true;
    for (auto& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(mixed, 0);
}

TEST(MessageBuffer, YieldsWhatWasAppendedAndIsEmptyThen) {
    LumMessageBuffer buffer;
    buffer << "one, " << nullptr << "two";
    EXPECT_EQ(buffer.str(buffer), "one, two");
    EXPECT_EQ(buffer.str(buffer), "");
    buffer << "three";
    EXPECT_EQ(buffer.str(buffer), "three");
}

TEST(MessageBuffer, TakesTheTextOutOfTheBufferNamed) {
    LumMessageBuffer one;
    LumMessageBuffer two;
    one << "one";
    two << "two";
    EXPECT_EQ(one.str(two), "two");
    EXPECT_EQ(one.str(one), "one");
}

TEST(MessageBuffer, StartsEmptyThoughItIsUsedAgain) {
    {
        LumMessageBuffer buffer;
        buffer << "left behind";
    }
    LumMessageBuffer next;
    EXPECT_EQ(next.str(next), "");
}

TEST(MessageBuffer, HoldsLongTextsAndManyAtOnce) {
    const std::string text(100000, 'x');
    std::vector<std::unique_ptr<LumMessageBuffer>> buffers;
    for (int i = 0; i < 20; ++i) {
        buffers.push_back(std::make_unique<LumMessageBuffer>());
        *buffers.back() << text.c_str() << std::to_string(i).c_str();
    }
    for (int i = 0; i < 20; ++i) {
        LumMessageBuffer& buffer = *buffers[static_cast<std::size_t>(i)];
        EXPECT_EQ(buffer.str(buffer), text + std::to_string(i));
    }
}

struct LogsWhenItsThreadEnds {
    ~LogsWhenItsThreadEnds() {
        LumMessageBuffer buffer;
        buffer << "last words";
        *words = buffer.str(buffer);
    }

    std::string* words = nullptr;
};

TEST(MessageBuffer, CanBeUsedWhileItsThreadEnds) {
    std::string words;
    std::thread([&] {
        thread_local LogsWhenItsThreadEnds logger; // made before the thread's first buffer, so destroyed after it
        logger.words = &words;
        LumMessageBuffer buffer;
        buffer << "first words";
    }).join();
    EXPECT_EQ(words, "last words");
}

void logLine(int level, const std::string& text) {
    LumLogger::logLevelMessage("function", "file", 1, "Hearth.Test", level, nullptr, 0, 0, text);
}

void traceLine(int level, const std::string& text) {
    LumLogger::traceLevelMessage("function", "file", 1, "Hearth.Test", level, nullptr, 0, 0, text);
}

TEST(Logger, WritesLogAndTraceWhereTheConfigurationSaysAboveTheirThresholds) {
    logFile().write("");
    traceFile().write("");
    for (const int level : {3000, 4000, 6000}) {
        logLine(level, "log " + std::to_string(level));
        traceLine(level, "trace " + std::to_string(level));
    }
    EXPECT_THAT(logFile().read(), HasSubstr("error [Hearth.Test] log 6000\n"));
    EXPECT_THAT(logFile().read(), Not(HasSubstr("log 4000")));
    EXPECT_THAT(traceFile().read(), HasSubstr("info [Hearth.Test] file:1 function(): trace 4000\n"));
    EXPECT_THAT(traceFile().read(), HasSubstr("trace 6000\n"));
    EXPECT_THAT(traceFile().read(), Not(HasSubstr("trace 3000")));
}

TEST(Logger, ShowsAnObserverWhyARequestFailed) {
    treeFile().write("colour = 1\n");
    std::vector<std::string> shown;
    OrvAgent_observeLog(
        6000,
        [](int level, const char* logger, const char* message, void* context) {
            static_cast<std::vector<std::string>*>(context)->push_back(std::to_string(level) + " " + logger + " " +
                                                                       message);
        },
        &shown);
    EXPECT_ANY_THROW(scan());
    logLine(5999, "too low");
    OrvAgent_observeLog(0, nullptr, nullptr);
    EXPECT_ANY_THROW(scan());
    EXPECT_THAT(shown, ElementsAre("6000 Hearth.Agent " + treeFile().path() + ":1: colour: unknown key"));
}

TEST(Logger, LosesNoLineOfManyThreads) {
    logFile().write("");
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([] {
            for (int j = 0; j < 250; ++j) {
                LumMessageBuffer buffer;
                buffer << "line";
                logLine(6000, buffer.str(buffer));
            }
        });
    }
    for (auto& thread : threads) {
        thread.join();
    }
    const std::string text = logFile().read();
    EXPECT_EQ(std::count(text.begin(), text.end(), '\n'), 1000);
}

TEST(DateTimeValue, HoldsItsFields) {
    const Orv::DateTime time({2026, 12, 31, 23, 58, 59, 999, -11});
    EXPECT_EQ(time.getYear(), 2026);
    EXPECT_EQ(time.getMonth(), 12);
    EXPECT_EQ(time.getDay(), 31);
    EXPECT_EQ(time.getHour(), 23);
    EXPECT_EQ(time.getMinute(), 58);
    EXPECT_EQ(time.getSecond(), 59);
    EXPECT_EQ(time.getMillisecond(), 999);
    EXPECT_EQ(time.getOffset(), -11);
    EXPECT_EQ(Orv::DateTime().getYear(), 0);
}

TEST(DateTimeValue, IsCopiedByValue) {
    Orv::DateTime time({2026, 1, 1, 0, 0, 0, 0, 0});
    const Orv::DateTime copy(time);
    time = Orv::DateTime({1999, 2, 3, 0, 0, 0, 0, 5});
    EXPECT_EQ(copy.getYear(), 2026);
    EXPECT_EQ(time.getYear(), 1999);
    EXPECT_EQ(time.getOffset(), 5);
    const Orv::DateTime& same = time;
    time = same;
    EXPECT_EQ(time.getYear(), 1999);
}

TEST(TextEqual, IgnoresTheCaseOfAsciiLettersOnly) {
    EXPECT_TRUE(Orv::textEqual("MARLO_NetworkAdapter", "marlo_networkADAPTER"));
    EXPECT_TRUE(Orv::textEqual("", ""));
    EXPECT_FALSE(Orv::textEqual("abc", "ab"));
    EXPECT_FALSE(Orv::textEqual("ab", "abc"));
    EXPECT_FALSE(Orv::textEqual("a_", "a\x7F"));
    EXPECT_FALSE(Orv::textEqual("@", "`")); // a bit apart, as letters are
    EXPECT_FALSE(Orv::textEqual("\xC3\x84", "\xC3\xA4"));
}

TEST(TextEqual, TakesNullAsEqualToNullOnly) {
    EXPECT_TRUE(Orv::textEqual(nullptr, nullptr));
    EXPECT_FALSE(Orv::textEqual(nullptr, ""));
    EXPECT_FALSE(Orv::textEqual("", nullptr));
}

TEST(StripSpaces, RemovesEverySpaceAndNothingElse) {
    EXPECT_EQ(Orv::stripSpaces(" Local Area  1 "), "LocalArea1");
    EXPECT_EQ(Orv::stripSpaces("a\tb\nc"), "a\tb\nc");
    EXPECT_EQ(Orv::stripSpaces("   "), "");
    EXPECT_EQ(Orv::stripSpaces(""), "");
}

TEST(SystemName, IsThereAndStaysTheSame) {
    const std::string name = Orv::getSystemName();
    EXPECT_FALSE(name.empty());
    for (int i = 0; i < 1000; ++i) {
        ASSERT_EQ(Orv::getSystemName(), name);
    }
}

} // namespace
