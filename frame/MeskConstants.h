// Texts shared by the command sources. Each source that includes this header gets its own
// copy, built when the library is loaded.
#pragma once

#include <string>

namespace OrvaneCli {
namespace MeskNamespace {

// Default multicast groups of an interface.
static const std::string MASTER_GROUP_MULTICAST_ADDRESS = "224.1.2.3";
static const std::string MASTER_GROUP_IPV6_MULTICAST_ADDRESS = "FF19:0:0:0:0:1:2:3";
static const std::string AGENT_GROUP_MULTICAST_ADDRESS = "224.2.3.4";
static const std::string AGENT_GROUP_IPV6_MULTICAST_ADDRESS = "FF19:0:0:0:0:2:3:4";

// Traffic types of an interface.
static const std::string TRAFFIC_TYPE_WITNESS = "witness";
static const std::string TRAFFIC_TYPE_MESK = "mesk";

// Kept for compatibility; no command uses them.
static const std::string TRAFFIC_TYPE_ALL = "all";
static const std::string CANNOT_REMOVE_LAST_HDD = "Can not remove last HDD";

}  // namespace MeskNamespace
}  // namespace OrvaneCli
