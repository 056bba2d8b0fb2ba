#include "agent/file/FileWatch.h"

#include "agent/config/Descriptor.h"
#include "agent/events/Differences.h"
#include "agent/events/WaitSet.h"
#include "agent/file/ControlPipe.h"
#include "agent/file/Script.h"

#include <array>
#include <cerrno>
#include <cstring>
#include <exception>
#include <filesystem>
#include <optional>
#include <set>
#include <system_error>
#include <utility>

#include <sys/inotify.h>
#include <unistd.h>

namespace Orv::Agent {

namespace {

/** Tells when a file is complete again: closed by who wrote it, or replaced by a rename. */
class FileNotifier {
  public:
    explicit FileNotifier(const std::string& path) : _inotify(::inotify_init1(IN_CLOEXEC | IN_NONBLOCK)) {
        if (!_inotify) {
            throw std::system_error(errno, std::generic_category(), "inotify");
        }
        std::error_code ignored;
        watch(path);
        watch(std::filesystem::canonical(path, ignored)); // where it is a link: what it leads to
    }

    [[nodiscard]] int descriptor() const { return _inotify.number(); }

    /** Whether that has happened since the last call. */
    bool takeChange() {
        bool isChanged = false;
        alignas(inotify_event) std::array<char, 4096> buffer{};
        for (ssize_t length = 0; (length = ::read(descriptor(), buffer.data(), buffer.size())) > 0;) {
            for (std::size_t place = 0; place < static_cast<std::size_t>(length);) {
                const auto* event = reinterpret_cast<const inotify_event*>(&buffer.at(place));
                isChanged = isChanged || (event->mask & IN_Q_OVERFLOW) != 0 ||
                            (event->len > 0 && _names.count(event->name) != 0);
                place += sizeof(inotify_event) + event->len;
            }
        }
        return isChanged;
    }

  private:
    /** The directory is watched, for a file that is replaced is another file. */
    void watch(const std::filesystem::path& file) {
        if (file.empty()) {
            return;
        }
        const auto directory = file.has_parent_path() ? file.parent_path() : std::filesystem::path(".");
        if (::inotify_add_watch(descriptor(), directory.c_str(), IN_CLOSE_WRITE | IN_MOVED_TO) < 0) {
            throw std::system_error(errno, std::generic_category(), directory.string() + ": cannot be watched");
        }
        _names.insert(file.filename().string());
    }

    Descriptor _inotify;
    std::set<std::string> _names;
};

class FileWatch : public EventWatch {
  public:
    FileWatch(BackEnd& backEnd, const std::string& path, const std::string& control, EventSink& sink)
        : _backEnd(backEnd), _sink(sink), _notifier(path) {
        _sources.add(_notifier.descriptor());
        if (!control.empty()) {
            _control.emplace(control);
            _sources.add(_control->descriptor());
        }
        _known = _backEnd.snapshot();
    }

    [[nodiscard]] int descriptor() const override { return _sources.descriptor(); }

    void collect() override {
        _isStale = _notifier.takeChange() || _isStale;
        if (_isStale) {
            readTree();
        }
        if (_control) {
            for (const std::string& line : _control->lines()) {
                obey(line);
            }
        }
    }

  private:
    void post(std::vector<Event> events) {
        for (Event& event : events) {
            _sink.post(std::move(event));
        }
    }

    /** A file that is wrong has no state: the next that is right is compared with the last that was. */
    void readTree() {
        std::shared_ptr<const Tree> fresh = _backEnd.snapshot();
        _isStale = false;
        post(eventsBetween(*_known, *fresh, std::chrono::system_clock::now()));
        _known = std::move(fresh);
    }

    void obey(const std::string& line) {
        try {
            post(play(line, *_known));
        } catch (const std::exception& failure) {
            _sink.report(failure.what());
        }
    }

    BackEnd& _backEnd;
    EventSink& _sink;
    FileNotifier _notifier;
    std::optional<ControlPipe> _control;
    WaitSet _sources;
    std::shared_ptr<const Tree> _known; ///< the last state that was reported
    bool _isStale = false;
};

} // namespace

std::unique_ptr<EventWatch> makeFileWatch(BackEnd& backEnd, const std::string& path, const std::string& control,
                                          EventSink& sink) {
    return std::make_unique<FileWatch>(backEnd, path, control, sink);
}

} // namespace Orv::Agent
