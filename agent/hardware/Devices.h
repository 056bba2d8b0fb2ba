/**
 * @file
 * Describing the devices that carry interfaces, by sysfs, the udev database and the firmware.
 */
#pragma once

#include "agent/hardware/Hardware.h"
#include "agent/hardware/HostInterface.h"

#include <filesystem>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <vector>

struct udev;

namespace Orv::Agent::Hardware {

using Linux::DeviceName;
using Linux::ParentDevice;

/**
 * Reads descriptions of devices; what is the same for all of them is read once, when it is made. For one thread. With
 * a `sysRoot` the files below it stand for those of /sys, and the udev database is left out.
 */
class DeviceReader {
  public:
    explicit DeviceReader(std::string sysRoot = "");

    /** As describeDevice does. */
    [[nodiscard]] std::optional<ParentDevice> describe(const DeviceName& device) const;

    /** The device that /sys/class/net names for an interface; none for a virtual one. */
    [[nodiscard]] std::optional<ParentDevice> describeOfInterface(const std::string& interface) const;

    /** A directory of /sys/class/net, below the root. */
    [[nodiscard]] std::filesystem::path interfaceDirectory(const std::string& interface) const;

  private:
    using Path = std::filesystem::path;

    [[nodiscard]] std::optional<ParentDevice> describePath(const Path& link) const;
    [[nodiscard]] std::optional<std::string> property(const Path& device, const char* name) const;
    [[nodiscard]] std::optional<std::string> firstText(const Path& device, const char* property,
                                                       std::initializer_list<const char*> attributes) const;
    [[nodiscard]] bool isManagementController(const Path& parent, const Path& device) const;

    struct UdevCloser {
        void operator()(udev* context) const;
    };

    std::string _root;
    std::unique_ptr<udev, UdevCloser> _udev; ///< null: no udev database
    std::vector<HostInterface> _hostInterfaces;
};

} // namespace Orv::Agent::Hardware
