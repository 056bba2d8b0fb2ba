#include "host/cli/Text.h"

#include "host/schema/Utf8.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <clocale>
#include <cwchar>

namespace marlo::cli {

namespace {

/** Character widths are those of Unicode whatever the process's locale is; glibc has C.UTF-8 built in. */
class Utf8Locale {
  public:
    Utf8Locale() : _before(uselocale(locale())) {}

    ~Utf8Locale() { uselocale(_before); }

    Utf8Locale(const Utf8Locale&) = delete;
    Utf8Locale& operator=(const Utf8Locale&) = delete;

  private:
    static locale_t locale() {
        static const locale_t utf8 = newlocale(LC_CTYPE_MASK, "C.UTF-8", nullptr);
        return utf8;
    }

    locale_t _before;
};

std::size_t characterWidth(char32_t c) {
    if (c < 0x80) {
        return 1;
    }
    const Utf8Locale utf8;
    const int width = wcwidth(static_cast<wchar_t>(c));
    return width < 0 ? 1 : static_cast<std::size_t>(width);
}

bool isControl(char32_t c) {
    return c < 0x20 || (c >= 0x7F && c < 0xA0);
}

constexpr char32_t Replacement = 0xFFFD;

/** Calls `use` with each character of a text, U+FFFD for a byte that belongs to none. */
template <class Use>
void forEachCharacter(std::string_view text, const Use& use) {
    while (!text.empty()) {
        const auto c = takeUtf8(text);
        if (!c) {
            text.remove_prefix(1);
        }
        use(c.value_or(Replacement));
    }
}

std::string quote(std::string_view text) {
    constexpr std::string_view Special = "\b\t\n\f\r\"\\";
    constexpr std::string_view Letters = "btnfr\"\\";
    constexpr std::string_view Digits = "0123456789ABCDEF";
    std::string quoted = "\"";
    forEachCharacter(text, [&](char32_t c) {
        const std::size_t special = c < 0x80 ? Special.find(static_cast<char>(c)) : std::string_view::npos;
        if (special != std::string_view::npos) {
            quoted += {'\\', Letters[special]};
        } else if (isControl(c)) {
            quoted += {'\\', 'x', '0', '0', Digits[c >> 4], Digits[c & 0xF]};
        } else {
            appendUtf8(quoted, c);
        }
    });
    return quoted + '"';
}

std::string showReal(double number) {
    std::array<char, 32> text{};
    return {text.data(), std::to_chars(text.data(), text.data() + text.size(), number).ptr};
}

/** Shows what a value holds; `Quote` decides how texts look. */
struct Show {
    bool quotes;

    [[nodiscard]] std::string text(std::string_view text) const { return quotes ? quote(text) : makePrintable(text); }

    std::string operator()(std::monostate) const { return "NULL"; }

    std::string operator()(bool value) const { return value ? "TRUE" : "FALSE"; }

    std::string operator()(char16_t value) const {
        std::string character;
        appendUtf8(character, value);
        return quotes ? "'" + makePrintable(character) + "'" : makePrintable(character);
    }

    std::string operator()(std::uint64_t value) const { return std::to_string(value); }

    std::string operator()(std::int64_t value) const { return std::to_string(value); }

    std::string operator()(double value) const { return showReal(value); }

    std::string operator()(const std::string& value) const { return text(value); }

    std::string operator()(const DateTime& value) const { return text(value.text); }

    std::string operator()(const std::shared_ptr<const ObjectPath>& value) const {
        return value ? text(value->toString()) : "NULL";
    }

    std::string operator()(const std::shared_ptr<const Instance>& value) const {
        return value ? "instance of " + makePrintable(value->path.className) : "NULL";
    }

    std::string operator()(const Value::Array& value) const {
        std::string list;
        for (const Value& element : value) {
            list += (list.empty() ? "" : ", ") + std::visit(*this, element.data);
        }
        return quotes ? "{" + list + "}" : list;
    }
};

} // namespace

std::string makePrintable(std::string_view text) {
    std::string printable;
    printable.reserve(text.size());
    forEachCharacter(text, [&printable](char32_t c) { appendUtf8(printable, isControl(c) ? Replacement : c); });
    return printable;
}

std::size_t displayWidth(std::string_view text) {
    std::size_t width = 0;
    forEachCharacter(text, [&width](char32_t c) { width += characterWidth(c); });
    return width;
}

std::size_t fittingLength(std::string_view text, std::size_t width) {
    std::string_view rest = text;
    std::size_t used = 0;
    std::size_t length = 0;
    while (!rest.empty()) {
        const auto c = takeUtf8(rest);
        if (!c) {
            rest.remove_prefix(1);
        }
        used += characterWidth(c.value_or(Replacement));
        if (used > width && length > 0) {
            break;
        }
        length = text.size() - rest.size();
    }
    return length;
}

std::string showValue(const Value& value) {
    return std::visit(Show{true}, value.data);
}

std::string showPlainly(const Value& value) {
    return std::visit(Show{false}, value.data);
}

std::vector<std::string> showInCell(const Value& value) {
    std::vector<std::string> lines;
    const Value::Array single = {value};
    const auto* const array = std::get_if<Value::Array>(&value.data);
    for (const Value& element : array == nullptr ? single : *array) {
        const auto* const truth = std::get_if<bool>(&element.data);
        const std::string text = element.isNull()   ? std::string()
                                 : truth == nullptr ? showPlainly(element)
                                                    : std::string(*truth ? "yes" : "no");
        if (!text.empty()) {
            lines.push_back(text);
        }
    }
    return lines.empty() ? std::vector<std::string>{"-"} : lines;
}

std::string showInstance(const Instance& instance) {
    std::size_t width = 0;
    for (const NamedValue& property : instance.properties) {
        width = std::max(width, property.name.size());
    }
    std::string text = makePrintable(instance.path.toString()) + "\n";
    for (const NamedValue& property : instance.properties) {
        const std::string padding(width - property.name.size(), ' ');
        text += "  " + makePrintable(property.name) + padding + " = " + showValue(property.value) + "\n";
    }
    return text;
}

} // namespace marlo::cli
