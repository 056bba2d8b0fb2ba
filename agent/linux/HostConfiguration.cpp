#include "agent/linux/HostConfiguration.h"

#include "agent/text/Text.h"

#include <utility>

#include <sys/utsname.h>

namespace Orv::Agent::Linux {

namespace {

std::string currentNodeName() {
    utsname names{};
    return uname(&names) == 0 ? names.nodename : "";
}

} // namespace

bool HostConfiguration::refresh() {
    std::string nodeName = currentNodeName();
    if (_isRead && nodeName == _nodeName && !_files.changed()) {
        return false;
    }
    _files.forget();
    Content content{cleanText(nodeName.substr(0, nodeName.find('.'))),
                    readHostDomain(_files, nodeName),
                    readResolvConf(_files),
                    readLinkResolvers(_files),
                    readIfupdown(_files),
                    readNetworkd(_files)};
    const bool differs = !_isRead || content != _content;
    _content = std::move(content);
    _nodeName = std::move(nodeName);
    _isRead = true;
    return differs;
}

ResolverSettings HostConfiguration::resolverOf(int index) const {
    ResolverSettings settings = _content.resolver;
    if (const auto link = _content.linkResolvers.find(index); link != _content.linkResolvers.end()) {
        const ResolverSettings& own = link->second;
        settings.servers = own.servers.empty() ? settings.servers : own.servers;
        settings.suffixes = own.suffixes.empty() ? settings.suffixes : own.suffixes;
        settings.domain = own.domain.empty() ? settings.domain : own.domain;
    }
    if (settings.domain.empty()) {
        settings.domain = _content.hostDomain;
    }
    if (settings.domain.empty() && !settings.suffixes.empty()) {
        settings.domain = settings.suffixes.front();
    }
    return settings;
}

std::optional<AddressMode> HostConfiguration::modeOf(const InterfaceFacts& interface) const {
    if (const auto named = _content.ifupdown.find(interface.name); named != _content.ifupdown.end()) {
        return named->second;
    }
    return _content.networkd.modeOf(interface);
}

} // namespace Orv::Agent::Linux
