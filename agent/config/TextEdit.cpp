#include "agent/config/TextEdit.h"

#include <algorithm>
#include <tuple>

namespace Orv::Agent {

std::string TextEdit::applied(std::string_view text) const {
    std::vector<Splice> ordered = _splices;
    // What is inserted in front of a piece comes before what becomes of the piece.
    std::stable_sort(ordered.begin(), ordered.end(), [](const Splice& left, const Splice& right) {
        return std::tie(left.begin, left.end) < std::tie(right.begin, right.end);
    });
    std::string result;
    std::size_t done = 0;
    for (const Splice& splice : ordered) {
        result += text.substr(done, splice.begin - done);
        result += splice.text;
        done = splice.end;
    }
    return result.append(text.substr(done));
}

} // namespace Orv::Agent
