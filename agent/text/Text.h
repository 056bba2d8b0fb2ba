/**
 * @file
 * Making foreign bytes fit to be shown.
 */
#pragma once

#include <string>
#include <string_view>

namespace Orv::Agent {

/**
 * `bytes` as valid UTF-8 without control characters (C0, DEL and C1): every byte that is part of no valid sequence
 * becomes U+FFFD, every control character a space. Text that is already fit comes back unchanged.
 */
std::string cleanText(std::string_view bytes);

} // namespace Orv::Agent
