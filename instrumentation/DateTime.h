/**
 * @file
 * The agent's time value, handed to monitoring callbacks.
 */
#pragma once

#include "instrumentation/Export.h"

namespace Orv {

/**
 * A local calendar time with its offset from UTC. A value: copies are independent of each other.
 *
 * The representation is the agent library's own. Objects may be read by several threads at once as long as none of
 * them assigns to them.
 */
class ORV_API DateTime {
  public:
    /** Calendar fields: year in full, month 1 to 12, day 1 to 31; no range is enforced. */
    struct Fields {
        unsigned short year = 0;
        unsigned short month = 0;
        unsigned short day = 0;
        unsigned short hour = 0;
        unsigned short minute = 0;
        unsigned short second = 0;
        unsigned short millisecond = 0;
        short offset = 0; ///< whole hours east of UTC
    };

    /** All fields 0. */
    DateTime();
    explicit DateTime(const Fields& fields);
    DateTime(const DateTime& other);
    DateTime& operator=(const DateTime& other);
    ~DateTime();

    [[nodiscard]] unsigned short getYear() const;
    [[nodiscard]] unsigned short getMonth() const;
    [[nodiscard]] unsigned short getDay() const;
    [[nodiscard]] unsigned short getHour() const;
    [[nodiscard]] unsigned short getMinute() const;
    [[nodiscard]] unsigned short getSecond() const;
    [[nodiscard]] unsigned short getMillisecond() const;
    /** Whole hours east of UTC; negative west of it. */
    [[nodiscard]] short getOffset() const;

  private:
    struct State;
    State* _state;
};

} // namespace Orv
