#include "instrumentation/DateTime.h"

#include <memory>

namespace Orv {

struct DateTime::State {
    Fields fields;
};

DateTime::DateTime() : DateTime(Fields{}) {}

DateTime::DateTime(const Fields& fields) : _state(std::make_unique<State>(State{fields}).release()) {}

DateTime::DateTime(const DateTime& other) : DateTime(other._state->fields) {}

DateTime& DateTime::operator=(const DateTime& other) {
    if (this != &other) {
        *_state = *other._state;
    }
    return *this;
}

DateTime::~DateTime() {
    const std::unique_ptr<State> state(_state);
}

unsigned short DateTime::getYear() const {
    return _state->fields.year;
}

unsigned short DateTime::getMonth() const {
    return _state->fields.month;
}

unsigned short DateTime::getDay() const {
    return _state->fields.day;
}

unsigned short DateTime::getHour() const {
    return _state->fields.hour;
}

unsigned short DateTime::getMinute() const {
    return _state->fields.minute;
}

unsigned short DateTime::getSecond() const {
    return _state->fields.second;
}

unsigned short DateTime::getMillisecond() const {
    return _state->fields.millisecond;
}

short DateTime::getOffset() const {
    return _state->fields.offset;
}

} // namespace Orv
