#include "indication/NetworkIndication.h"
#include "trace/Trace.h"

namespace Orv::NetworkAdapterComposite {

namespace {

/** A field has room for so many characters; what does not fit is cut. */
constexpr std::size_t FIELD_ROOM = 5;
constexpr std::size_t CALENDAR_WIDTH = 2;
constexpr std::size_t FRACTION_WIDTH = 6;
constexpr std::size_t OFFSET_WIDTH = 3;
constexpr int MINUTES_PER_HOUR = 60;

std::string number(int value) {
    return std::to_string(value).substr(0, FIELD_ROOM);
}

std::string filledUp(const std::string& text, std::size_t width) {
    return text.size() < width ? addZero(static_cast<unsigned char>(width - text.size())) + text : text;
}

/** The sign of a positive offset stands before the zeros; that of a negative one is part of what they fill up. */
std::string offsetText(int hours) {
    const std::string minutes = number(hours * MINUTES_PER_HOUR);
    return (minutes.find('-') == std::string::npos ? "+" : "") + filledUp(minutes, OFFSET_WIDTH);
}

} // namespace

std::string convertCIMDateTime(Orv::DateTime time) {
    const ProviderLog log(loggerNetworkIndication, INDICATION_UNIT, __func__);
    log.entering();
    std::string text = number(time.getYear());
    for (const int field : {time.getMonth(), time.getDay(), time.getHour(), time.getMinute(), time.getSecond()}) {
        text += filledUp(number(field), CALENDAR_WIDTH);
    }
    text += "." + filledUp(number(time.getMillisecond()), FRACTION_WIDTH);
    return text + offsetText(time.getOffset());
}

std::string addZero(unsigned char count) {
    return std::string(count, '0'); // NOLINT(modernize-return-braced-init-list): braces would make it two characters
}

} // namespace Orv::NetworkAdapterComposite
