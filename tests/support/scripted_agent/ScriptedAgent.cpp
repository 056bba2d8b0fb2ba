#include "tests/support/scripted_agent/ScriptedAgent.h"

#include "tests/support/scripted_agent/Recorder.h"

#include <algorithm>
#include <iterator>
#include <memory>
#include <mutex>

namespace scripted_agent {

namespace {

struct Record {
    std::mutex mutex;
    std::vector<std::string> lines;
    int cursors = 0;
};

Record& theRecord() {
    static Record record;
    return record;
}

} // namespace

Script& script() {
    static Script theScript;
    return theScript;
}

void reset() {
    script() = Script();
    resetEvents();
    clearRecord();
}

void clearRecord() {
    const std::lock_guard lock(theRecord().mutex);
    theRecord().lines.clear();
    theRecord().cursors = 0;
}

std::vector<std::string> record() {
    const std::lock_guard lock(theRecord().mutex);
    return theRecord().lines;
}

std::vector<std::string> recorded(std::string_view prefix) {
    const std::lock_guard lock(theRecord().mutex);
    std::vector<std::string> found;
    std::copy_if(theRecord().lines.begin(), theRecord().lines.end(), std::back_inserter(found),
                 [&](const std::string& line) { return line.starts_with(prefix); });
    return found;
}

void note(std::string line) {
    add(std::move(line));
}

void failAt(std::string call, int nth, std::function<void()> failure) {
    auto left = std::make_shared<int>(nth);
    script().before = [call = std::move(call), left, failure = std::move(failure)](std::string_view seen) {
        if (seen.starts_with(call) && --*left == 0) {
            failure();
        }
    };
}

bool watched() {
    return script().recording || script().before;
}

void announce(const std::string& call) {
    if (script().before) {
        script().before(call);
    }
}

void add(std::string line) {
    if (script().recording) {
        const std::lock_guard lock(theRecord().mutex);
        theRecord().lines.push_back(std::move(line));
    }
}

int nextCursor() {
    const std::lock_guard lock(theRecord().mutex);
    return ++theRecord().cursors;
}

std::string quoted(const char* text) {
    return text != nullptr ? '"' + std::string(text) + '"' : "null";
}

} // namespace scripted_agent
