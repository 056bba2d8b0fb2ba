// The events of a described host: what is written to its file, and what commands play.
#include "agent/events/Differences.h"
#include "agent/file/ControlPipe.h"
#include "agent/file/FileBackEnd.h"
#include "agent/file/Script.h"
#include "agent/file/TreeFile.h"
#include "tests/agent/TemporaryFile.h"

#include <filesystem>
#include <fstream>
#include <thread>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <sys/stat.h>

namespace {

using namespace Orv::Agent;
using namespace Orv::NodeLexicon;
using namespace std::chrono_literals;
using Orv::Test::messageOf;
using Orv::Test::TemporaryFile;
using testing::ElementsAre;
using testing::HasSubstr;

struct Seen {
    std::string name;
    EventCode code;
    unsigned int status;

    bool operator==(const Seen&) const = default;

    friend std::ostream& operator<<(std::ostream& out, const Seen& seen) {
        return out << seen.name << ' ' << static_cast<unsigned>(seen.code) << ' ' << seen.status;
    }
};

Seen status(const std::string& name, unsigned int code) {
    return {name, EventCode::status, code};
}

Seen shown(const Event& event) {
    return {event.node->description, event.code, statusOf(*event.node).value_or(0)};
}

class Recorder : public EventSink {
  public:
    void post(Event event) override { seen.push_back(shown(event)); }

    void report(const std::string& text) override { reports.push_back(text); }

    std::vector<Seen> seen;
    std::vector<std::string> reports;
};

bool isReadable(int descriptor, std::chrono::milliseconds patience) {
    pollfd file{descriptor, POLLIN, 0};
    return ::poll(&file, 1, static_cast<int>(patience.count())) == 1;
}

std::string adapter(const std::string& identity, const std::string& keys) {
    return "[[adapter]]\nidentity = \"" + identity + "\"\n" + keys + "\n";
}

struct FileWatchTest : testing::Test {
    void start(const std::string& content) {
        file.write(content);
        backEnd = makeFileBackEnd(file.path(), control);
        watch = backEnd->watch(recorder);
    }

    /** What is reported after the watch has been woken. */
    std::vector<Seen> next() {
        EXPECT_TRUE(isReadable(watch->descriptor(), 5s));
        watch->collect();
        EXPECT_FALSE(isReadable(watch->descriptor(), 0ms));
        return std::exchange(recorder.seen, {});
    }

    void command(const std::string& text) const { std::ofstream(control) << text; }

    TemporaryFile file{"lab.toml", ""};
    std::string control = (file.directory() / "control").string();
    std::unique_ptr<BackEnd> backEnd;
    Recorder recorder;
    std::unique_ptr<EventWatch> watch;
};

TEST_F(FileWatchTest, ReportsAStatusThatIsWritten) {
    start(adapter("eth0", "status = 1") + adapter("eth1", "status = 1"));
    EXPECT_FALSE(isReadable(watch->descriptor(), 0ms));
    file.replace(adapter("eth0", "status = 12") + adapter("eth1", "status = 1"));
    EXPECT_THAT(next(), ElementsAre(status("eth0", 12)));
    file.write(adapter("eth0", "status = 12") + adapter("eth1", "status = 5"));
    EXPECT_THAT(next(), ElementsAre(status("eth1", 5)));
    file.replace(adapter("eth0", "status = 33") + adapter("eth1", "status = 5"));
    EXPECT_THAT(next(), ElementsAre(status("eth0", 33))) << "any number will do";
}

TEST_F(FileWatchTest, ReportsNoChangeOfOtherThings) {
    start(adapter("eth0", "status = 1"));
    file.replace("# a remark\n" + adapter("eth0", "status = 1\ndhcp = 3"));
    EXPECT_THAT(next(), ElementsAre());
    std::ofstream(file.directory() / "another.toml") << "status = 5";
    EXPECT_FALSE(isReadable(watch->descriptor(), 100ms) && (watch->collect(), !recorder.seen.empty()));
}

TEST_F(FileWatchTest, ReportsAddressesAdaptersThatComeAndAdaptersThatGo) {
    start(adapter("eth0", "status = 1") + adapter("eth1", "status = 5"));
    file.replace(adapter("eth0", "status = 1\nipv4_address = \"192.0.2.1\"") + adapter("eth1", "status = 5"));
    EXPECT_THAT(next(), ElementsAre(Seen{"eth0", EventCode::address, 1}));
    file.replace(adapter("eth2", "status = 1") + adapter("eth3", "status = 12"));
    EXPECT_THAT(next(), ElementsAre(status("eth0", 5), status("eth2", 1)));
}

TEST_F(FileWatchTest, ReportsWhatAPropertyWriteChanges) {
    start(
        adapter("eth0", "status = 1\ndhcp = 3\nipv4_address = \"192.0.2.1\"\nipv4_subnet_mask = \"255.255.255.0\""));
    const auto path = backEnd->snapshot()->nodesOfType(NODE_NETWORK_ADAPTER)[0]->path;
    backEnd->setProperty(path, PROP_IPV4_ADDRESS, std::string("192.0.2.2"));
    EXPECT_THAT(next(), ElementsAre(Seen{"eth0", EventCode::address, 1}));
}

TEST_F(FileWatchTest, ComparesAcrossATimeInWhichTheFileIsWrong) {
    start(adapter("eth0", "status = 1"));
    file.replace("status = ");
    EXPECT_TRUE(isReadable(watch->descriptor(), 5s));
    EXPECT_THAT(messageOf([&] { watch->collect(); }), HasSubstr(file.path() + ":1: "));
    EXPECT_NE(messageOf([&] { watch->collect(); }), "nothing was thrown") << "it still is";
    file.replace(adapter("eth0", "status = 12"));
    EXPECT_THAT(next(), ElementsAre(status("eth0", 12)));
}

TEST_F(FileWatchTest, FollowsAFileThatIsALink) {
    const TemporaryFile target("target.toml", adapter("eth0", "status = 1"));
    std::filesystem::create_symlink(target.path(), file.directory() / "link.toml");
    backEnd = makeFileBackEnd((file.directory() / "link.toml").string());
    watch = backEnd->watch(recorder);
    target.write(adapter("eth0", "status = 12"));
    EXPECT_THAT(next(), ElementsAre(status("eth0", 12)));
}

TEST_F(FileWatchTest, CannotBeginWithAFileThatIsWrong) {
    file.write("status = ");
    backEnd = makeFileBackEnd(file.path());
    EXPECT_THAT(messageOf([&] { backEnd->watch(recorder); }), HasSubstr(file.path() + ":1: "));
}

TEST_F(FileWatchTest, PlaysWhatItIsTold) {
    start(adapter("eth0", "status = 1") + adapter("bond0", "status = 1"));
    command("status eth0 12\nstatus eth0 12\n");
    EXPECT_THAT(next(), ElementsAre(status("eth0", 12), status("eth0", 12)));
    command("flap eth0\nfailover bond0\nfailback bond0\n");
    EXPECT_THAT(next(), ElementsAre(status("eth0", 12), status("eth0", 1), status("bond0", 32), status("bond0", 33)));
    const auto tree = backEnd->snapshot();
    EXPECT_EQ(statusOf(*tree->nodesOfType(NODE_NETWORK_ADAPTER)[0]), 1U) << "the tree stays as it is";
    EXPECT_THAT(recorder.reports, ElementsAre());
}

TEST_F(FileWatchTest, SaysWhatIsWrongWithACommandAndGoesOn) {
    start(adapter("eth0", "status = 1"));
    command("flop eth0\nstatus eth1 5\nstatus eth0 5\n");
    EXPECT_THAT(next(), ElementsAre(status("eth0", 5)));
    EXPECT_THAT(recorder.reports,
                ElementsAre("control pipe: \"flop\" is no command", "control pipe: there is no adapter \"eth1\""));
}

TEST_F(FileWatchTest, WaitsForTheEndOfALine) {
    start(adapter("eth0", "status = 1"));
    command("status eth0 1");
    EXPECT_THAT(next(), ElementsAre());
    command("2\n");
    EXPECT_THAT(next(), ElementsAre(status("eth0", 12)));
}

TEST(ControlPipe, IsMadeForItsOwnerAloneAndStays) {
    const TemporaryFile file("unused");
    const std::string path = (file.directory() / "control").string();
    { const ControlPipe pipe(path); }
    EXPECT_TRUE(std::filesystem::is_fifo(path));
    EXPECT_EQ(std::filesystem::status(path).permissions(), std::filesystem::perms(0600));
    EXPECT_NO_THROW(ControlPipe{path});
}

TEST(ControlPipe, MustBeAFifo) {
    const TemporaryFile file("control", "status eth0 12\n");
    EXPECT_THAT(messageOf([&] { const ControlPipe pipe(file.path()); }), HasSubstr("must be a FIFO"));
    EXPECT_THAT(messageOf([&] { const ControlPipe pipe("/nowhere/control"); }),
                HasSubstr("/nowhere/control: the control pipe cannot be made: No such file or directory"));
    std::filesystem::create_symlink(file.path(), file.directory() / "link");
    EXPECT_THAT(messageOf([&] { const ControlPipe pipe((file.directory() / "link").string()); }),
                HasSubstr("cannot be opened"));
}

TEST(ControlPipe, CutsALineThatIsTooLong) {
    const TemporaryFile file("unused");
    const std::string path = (file.directory() / "control").string();
    ControlPipe pipe(path);
    const std::string longest(ControlPipe::longestLine, 'x');
    std::ofstream(path) << longest << "\n" << longest << "y\n";
    EXPECT_THAT(pipe.lines(), ElementsAre(longest, longest));
}

std::shared_ptr<const Tree> lab() {
    return parseTree(adapter("eth0", "status = 1\ndevice = \"Card\"") + adapter("two words", "status = 1"),
                     "lab.toml");
}

std::vector<Seen> played(const std::string& line) {
    std::vector<Seen> seen;
    for (const Event& event : play(line, *lab())) {
        seen.push_back(shown(event));
    }
    return seen;
}

TEST(Script, PlaysBursts) {
    EXPECT_THAT(played("burst eth0 3"), ElementsAre(status("eth0", 12), status("eth0", 1), status("eth0", 12)));
    EXPECT_THAT(played("burst eth0 0"), ElementsAre());
    EXPECT_EQ(played("burst eth0 10000").size(), 10000U);
}

TEST(Script, TakesNamesWithBlanksAndLinesWithNothing) {
    EXPECT_THAT(played("  status two words  7 \r"), ElementsAre(status("two words", 7)));
    EXPECT_THAT(played("failover two words"), ElementsAre(status("two words", 32)));
    EXPECT_THAT(played(""), ElementsAre());
    EXPECT_THAT(played(" # status eth0 5"), ElementsAre());
}

TEST(Script, ShowsWhatIsAboveTheAdapter) {
    const auto events = play("flap eth0", *lab());
    ASSERT_EQ(events.size(), 2U);
    EXPECT_EQ(events[0].ancestors.size(), 3U);
    EXPECT_EQ(events[0].ancestors[0]->description, "Card");
}

struct Refusal {
    const char* line;
    const char* reason;
};

TEST(Script, RefusesWhatItDoesNotUnderstand) {
    const Refusal refusals[] = {
        {"STATUS eth0 1", "\"STATUS\" is no command"},
        {"status", "expected status NAME CODE, found \"status\""},
        {"status eth0", "expected status NAME CODE, found \"status eth0\""},
        {"status eth0 up", "expected status NAME CODE, found \"status eth0 up\""},
        {"status eth0 -1", "expected status NAME CODE, found \"status eth0 -1\""},
        {"status eth0 4294967296", "expected status NAME CODE, found \"status eth0 4294967296\""},
        {"burst 5", "expected burst NAME COUNT, found \"burst 5\""},
        {"burst eth0 1000001", "a burst has at most 1000000 events"},
        {"flap", "expected flap NAME, found \"flap\""},
        {"flap eth9", "there is no adapter \"eth9\""},
        {"flap \x01", "there is no adapter \" \""},
    };
    for (const Refusal& refusal : refusals) {
        EXPECT_EQ(messageOf([&] { play(refusal.line, *lab()); }), std::string("control pipe: ") + refusal.reason);
    }
}

} // namespace
