#include "host/wbem/Content.h"

#include "host/model/Instance.h"
#include "host/wbem/FieldText.h"
#include "host/wbem/HttpError.h"

#include <algorithm>
#include <cstdlib>
#include <string_view>
#include <vector>

namespace marlo::wbem {

namespace {

constexpr unsigned notAcceptable = 406;
constexpr unsigned unsupportedMediaType = 415;

/** The quality among the parameters of a choice: how much it is liked, 0 rules it out. */
double qualityOf(const std::vector<std::string_view>& parts) {
    for (std::size_t i = 1; i < parts.size(); ++i) {
        if (const auto quality = parameter(parts[i], "q")) {
            return std::strtod(std::string(*quality).c_str(), nullptr);
        }
    }
    return 1;
}

/** How closely a choice, such as text/xml, text/<any> or <any>/<any>, names an offer: 0 where it does not. */
int closeness(std::string_view choice, std::string_view offer) {
    if (equalNames(choice, offer)) {
        return 3;
    }
    const auto slash = offer.find('/');
    if (slash != std::string_view::npos && choice.ends_with("/*") &&
        equalNames(choice.substr(0, choice.size() - 2), offer.substr(0, slash))) {
        return 2;
    }
    return choice == "*/*" || choice == "*" ? 1 : 0;
}

/**
 * How much a client likes an offer (RFC 9110 12.5.1): what the choice says that names it most closely. One without
 * the field, or with an empty one, takes anything.
 */
double likingOf(const http::RequestHead& head, std::string_view field, std::string_view offer) {
    int closest = 0;
    double liking = 0;
    bool anything = true;
    for (const std::string_view value : head.values(field)) {
        for (const std::string_view choice : split(value, ',')) {
            const auto parts = split(choice, ';');
            const int close = closeness(parts[0], offer);
            anything = anything && parts[0].empty();
            if (close > closest) {
                closest = close;
                liking = qualityOf(parts);
            }
        }
    }
    return anything ? 1 : liking;
}

bool isUtf8Xml(std::string_view contentType) {
    const auto parts = split(contentType, ';');
    if (!equalNames(parts[0], "application/xml") && !equalNames(parts[0], "text/xml")) {
        return false;
    }
    return std::all_of(parts.begin() + 1, parts.end(), [](std::string_view part) {
        const auto charset = parameter(part, "charset");
        return !charset || equalNames(*charset, "utf-8");
    });
}

} // namespace

std::string checkContent(const http::RequestHead& head) {
    const auto types = head.values("Content-Type");
    if (types.size() > 1 || (types.size() == 1 && !isUtf8Xml(types[0]))) {
        throw HttpError(unsupportedMediaType, "", "requests are application/xml or text/xml in UTF-8");
    }
    const double application = likingOf(head, "Accept", "application/xml");
    const double text = likingOf(head, "Accept", "text/xml");
    if (std::max(application, text) <= 0 || likingOf(head, "Accept-Charset", "utf-8") <= 0) {
        throw HttpError(notAcceptable, "", "answers are application/xml or text/xml in UTF-8");
    }
    return text > application ? "text/xml" : "application/xml";
}

} // namespace marlo::wbem
