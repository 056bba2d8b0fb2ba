/**
 * @file
 * What was made of a file, for as long as the file stays as it was.
 */
#pragma once

#include "agent/config/TextFile.h"

#include <functional>
#include <memory>
#include <string>
#include <utility>

namespace Orv::Agent {

/**
 * Reads and parses one file again only when it has changed. For one thread at a time.
 *
 * A file whose times tell nothing new costs one stat call. One that was written so lately that its times may hide the
 * next write is read again, but parsed again only when its text differs.
 */
template <typename Made>
class FileCache {
  public:
    /** Makes the value of the text of the file at the path; what it throws leaves current(). */
    using Parser = std::function<std::shared_ptr<const Made>(const std::string& text, const std::string& path)>;

    FileCache(std::string path, Parser parser) : _path(std::move(path)), _parse(std::move(parser)) {}

    [[nodiscard]] const std::string& path() const { return _path; }

    /**
     * What the file says now. Throws std::system_error, which names the file, when it cannot be read, and what the
     * parser throws; the next call tries again.
     */
    std::shared_ptr<const Made> current() {
        if (_made == nullptr || !_settled || stampOf(_path) != _stamp) {
            refresh();
        }
        return _made;
    }

    /** What this reading of the file says, which is not kept. Throws what the parser throws. */
    [[nodiscard]] std::shared_ptr<const Made> madeOf(const TextFile& file) const {
        return isMadeOf(file) ? _made : _parse(file.text, _path);
    }

  private:
    static std::size_t hashOf(const TextFile& file) { return std::hash<std::string>()(file.text); }

    [[nodiscard]] bool isMadeOf(const TextFile& file) const {
        return _made != nullptr && file.stamp == _stamp && hashOf(file) == _textHash;
    }

    void refresh() {
        const TextFile file = readTextFile(_path);
        if (!isMadeOf(file)) {
            _made = nullptr; // its memory serves for the next one, if nobody holds it
            _made = _parse(file.text, _path);
        }
        _stamp = file.stamp;
        _settled = file.settled;
        _textHash = hashOf(file);
    }

    const std::string _path;
    const Parser _parse;
    std::shared_ptr<const Made> _made;
    FileStamp _stamp;
    bool _settled = false;
    std::size_t _textHash = 0;
};

} // namespace Orv::Agent
