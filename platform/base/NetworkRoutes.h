// NetworkRoutes: the kind of the active connection, from the kernel's own files.
#pragma once

#include <string>

#include "platform/device.h"

namespace platform::device {

// The interface of the default route with the lowest metric in a routing table of /proc/net/route's format; empty when none.
std::string defaultInterface(const std::string& routeFile);
// The kind of an interface, from its folder under `interfacesFolder` (/sys/class/net).
connection_type_e interfaceType(const std::string& interfacesFolder, const std::string& interface);

}  // namespace platform::device
