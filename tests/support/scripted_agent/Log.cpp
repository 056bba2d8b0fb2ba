#include "instrumentation/LumLog.h"
#include "tests/support/scripted_agent/Recorder.h"

#include <utility>

using scripted_agent::add;
using scripted_agent::announce;
using scripted_agent::quoted;

namespace LumLog {

struct LumMessageBuffer::State {
    std::string text;
};

LumMessageBuffer::LumMessageBuffer() : _state(nullptr) {
    announce("buffer()");
    _state = new State;
    add("buffer()");
}

LumMessageBuffer::~LumMessageBuffer() {
    add("~buffer()");
    delete _state;
}

LumMessageBuffer& LumMessageBuffer::operator<<(const char* text) {
    if (scripted_agent::watched()) {
        add("buffer << " + quoted(text));
    }
    _state->text += text != nullptr ? text : "";
    return *this;
}

std::string LumMessageBuffer::str(LumMessageBuffer& buffer) {
    add("buffer str");
    return std::exchange(buffer._state->text, {});
}

namespace {

struct Line {
    const char* sink;
    const char* function;
    const char* file;
    int line;
    const std::string& logger;
    int level;
    bool reservedIsNone;
    const std::string& message;
};

void write(const Line& line) {
    if (!scripted_agent::watched()) {
        return;
    }
    std::string text = std::string(line.sink) + ' ' + std::to_string(line.level) + ' ' + line.logger + ' ' +
                       line.file + ':' + std::to_string(line.line) + ' ' + line.function + " | " + line.message;
    announce(text);
    add(line.reservedIsNone ? std::move(text) : "wrong reserved arguments: " + text);
}

} // namespace

void LumLogger::logLevelMessage(const char* function, const char* file, int line, const std::string& logger,
                                int level, char* reserved, int reserved1, int reserved2, const std::string& message) {
    write({"log", function, file, line, logger, level, reserved == nullptr && reserved1 == 0 && reserved2 == 0,
           message});
}

void LumLogger::traceLevelMessage(const char* function, const char* file, int line, const std::string& logger,
                                  int level, char* reserved, int reserved1, int reserved2,
                                  const std::string& message) {
    write({"trace", function, file, line, logger, level, reserved == nullptr && reserved1 == 0 && reserved2 == 0,
           message});
}

} // namespace LumLog
