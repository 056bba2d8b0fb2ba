#include "tests/delivery/DeliveryFixture.h"

#include <array>
#include <atomic>
#include <csignal>
#include <cstdlib>
#include <map>
#include <random>
#include <set>

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>

namespace marlo::delivery {
namespace {

using namespace std::chrono_literals;

/** The poster as a process of its own. */
class Poster {
  public:
    explicit Poster(std::vector<std::string> arguments) {
        std::array<int, 2> ends{};
        if (::pipe2(ends.data(), O_CLOEXEC) != 0) {
            throw std::runtime_error("no pipe");
        }
        _output = http::Descriptor(ends[0]);
        const http::Descriptor theirs(ends[1]);
        posix_spawn_file_actions_t actions;
        ::posix_spawn_file_actions_init(&actions);
        ::posix_spawn_file_actions_adddup2(&actions, ends[1], STDOUT_FILENO);
        std::vector<char*> texts{const_cast<char*>(POSTER)};
        for (std::string& argument : arguments) {
            texts.push_back(argument.data());
        }
        texts.push_back(nullptr);
        if (::posix_spawn(&_process, POSTER, &actions, nullptr, texts.data(), environ) != 0) {
            throw std::runtime_error("no " POSTER);
        }
        ::posix_spawn_file_actions_destroy(&actions);
    }

    ~Poster() {
        if (_process != 0) {
            kill();
        }
    }

    Poster(const Poster&) = delete;
    Poster& operator=(const Poster&) = delete;

    void kill() {
        ::kill(_process, SIGKILL);
        await();
    }

    /** Waits for the end; the status as waitpid gives it. */
    int await() {
        int status = 0;
        ::waitpid(std::exchange(_process, 0), &status, 0);
        return status;
    }

    /** Waits for the first output. */
    void awaitOutput() { read(); }

    /** All lines until the end; one that was cut off is none. */
    std::vector<std::string> lines() {
        while (read()) {
        }
        std::vector<std::string> lines;
        for (std::size_t begin = 0, end = 0; (end = _text.find('\n', begin)) != std::string::npos; begin = end + 1) {
            lines.push_back(_text.substr(begin, end - begin));
        }
        return lines;
    }

  private:
    bool read() {
        std::array<char, 4096> buffer{};
        const ssize_t count = ::read(_output.get(), buffer.data(), buffer.size());
        _text.append(buffer.data(), count > 0 ? static_cast<std::size_t>(count) : 0);
        return count > 0;
    }

    pid_t _process = 0;
    http::Descriptor _output;
    std::string _text;
};

class Killed : public DeliveryFixture {
  protected:
    static int rounds() {
        const char* text = std::getenv("KILL_ROUNDS");
        return text == nullptr ? 5 : std::atoi(text);
    }

    /**
     * Repeats are the same indication, nothing is left out, and nothing overtakes. What a killed process had sent may
     * be read after the first of the next one's: connections are in order, each for itself.
     */
    static void expectInSequence(const std::vector<Listener::Received>& received) {
        std::map<std::int64_t, std::string> texts;
        std::map<int, std::int64_t> former; // by connection
        std::int64_t highest = -1;
        for (const Listener::Received& one : received) {
            ASSERT_EQ(one.context, received.front().context);
            ASSERT_LE(one.number, highest + 1);
            highest = std::max(highest, one.number);
            const auto [last, isFirst] = former.emplace(one.connection, one.number);
            ASSERT_TRUE(isFirst || one.number == last->second || one.number == last->second + 1) << one.number;
            last->second = one.number;
            const auto [known, isNew] = texts.emplace(one.number, one.property("Description"));
            ASSERT_EQ(known->second, one.property("Description")) << one.number;
        }
        std::map<std::string, int> next;
        for (const auto& [number, text] : texts) {
            const std::size_t dot = text.rfind('.');
            ASSERT_EQ(std::stoi(text.substr(dot + 1)), next[text.substr(0, dot)]++) << number << ": " << text;
        }
    }
};

TEST_F(Killed, ProcessesLoseNothingThatWasOnDisk) {
    std::minstd_rand numbers{std::random_device()()};
    std::atomic<unsigned> count{0};
    const Listener listener([&count](const Listener::Received& received) {
        return ++count % 50 == 0 ? Listener::refuse(received) : Listener::accept(received);
    });
    std::vector<std::string> promised;
    for (int round = 0; round < rounds(); ++round) {
        Poster poster({file, listener.url(), std::to_string(round)});
        poster.awaitOutput();
        std::this_thread::sleep_for(std::chrono::microseconds(numbers() % 100000));
        poster.kill();
        const auto lines = poster.lines();
        promised.insert(promised.end(), lines.begin(), lines.end());
    }
    Poster last({file, listener.url()});
    ASSERT_EQ(last.await(), 0);
    const auto received = listener.received();
    std::set<std::string> came;
    for (const Listener::Received& one : received) {
        came.insert(one.property("Description"));
    }
    ASSERT_GT(promised.size(), static_cast<std::size_t>(rounds()));
    for (const std::string& text : promised) {
        ASSERT_TRUE(came.contains(text)) << text;
    }
    expectInSequence(received);
    RecordProperty("promised", static_cast<int>(promised.size()));
    RecordProperty("received", static_cast<int>(received.size()));
}

} // namespace
} // namespace marlo::delivery
