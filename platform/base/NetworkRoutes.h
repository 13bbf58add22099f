// NetworkRoutes: the kind of the active connection, from the kernel's own files.
#pragma once

#include <string>

#include "platform/device.h"

namespace platform::device {

// The interface of the default route with the lowest metric in routing tables of the formats of /proc/net/route and
// /proc/net/ipv6_route; one of the second counts when the first has none. Empty when there is no route.
std::string defaultInterface(const std::string& routeFile, const std::string& route6File);
// The kind of an interface, from its folder under `interfacesFolder` (/sys/class/net).
connection_type_e interfaceType(const std::string& interfacesFolder, const std::string& interface);

}  // namespace platform::device
