#include "fuzz/Require.h"
#include "tests/filter/Filters.h"

/** Any text as a filter, in WQL behind an even first byte, else in CQL: it is refused with its place, or it is
 * applied. */
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    using namespace marlo;
    using fuzz::require;
    if (size == 0) {
        return 0;
    }
    const auto language = data[0] % 2 == 0 ? filter::Language::wql : filter::Language::cql;
    const std::string_view text = fuzz::textOf(data + 1, size - 1);
    try {
        const filter::Filter filter = filter::Filter::parse(text, language);
        require(filter.text() == text, "a filter keeps its text");
        const test::InstanceSubject subject(test::exampleEvent());
        const filter::Truth truth = filter.evaluate(subject);
        require(!filter.matches(subject) || truth == filter::Truth::yes, "what matches is true");
        filter.check(test::exampleSchema(), "root/test");
    } catch (const filter::Error& error) {
        require(std::string_view(error.what()).starts_with("line "), "a refusal has its place");
        require(error.offset() <= text.size(), "a place is in the text");
    }
    return 0;
}
