/**
 * @file
 * Who asks, and what they may do.
 */
#pragma once

#include <initializer_list>
#include <string>

namespace marlo::security {

enum class Role : unsigned {
    read = 1,      ///< classes, instances, queries, associations
    change = 2,    ///< instances and methods
    subscribe = 4, ///< filters, destinations and subscriptions
};

/** A user with roles. Nobody, with none, unless somebody was named. */
class Identity {
  public:
    Identity() = default;

    Identity(std::string name, std::initializer_list<Role> roles) : _name(std::move(name)) {
        for (const Role role : roles) {
            add(role);
        }
    }

    void add(Role role) { _roles |= static_cast<unsigned>(role); }

    [[nodiscard]] bool isNobody() const { return _name.empty(); }

    /** Empty for nobody. */
    [[nodiscard]] const std::string& name() const { return _name; }

    [[nodiscard]] bool may(Role role) const { return !isNobody() && (_roles & static_cast<unsigned>(role)) != 0; }

  private:
    std::string _name;
    unsigned _roles = 0;
};

} // namespace marlo::security
