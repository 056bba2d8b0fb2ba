/**
 * @file
 * resolv.conf(5), edited.
 */
#pragma once

#include "agent/persistence/NameService.h"

#include <string>
#include <string_view>

namespace Orv::Agent::Persistence {

/**
 * The text of a resolv.conf with what is wanted in it. `nameserver` lines are edited one by one where they stand, and
 * so are `domain` and `search`; of these two the last one counts for the resolver, so `search` always comes last. All
 * other lines, comments and options stay byte for byte. Pure; any text will do.
 */
std::string editResolvConf(std::string_view text, const NameSettings& wanted);

/** The file itself. Every program that resolves names notices when it changes; nobody needs to be told. */
class ResolvConf : public NameService {
  public:
    explicit ResolvConf(Environment environment) : _environment(std::move(environment)) {}

    [[nodiscard]] std::string name() const override { return "resolv.conf"; }

    [[nodiscard]] FileEdits plan(const NameSettings& wanted) const override;

    /** Nothing. */
    void apply(const InterfaceFacts& interface, const NameSettings& whole) override;

  private:
    Environment _environment;
};

} // namespace Orv::Agent::Persistence
