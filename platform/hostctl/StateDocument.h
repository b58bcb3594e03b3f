// The simulated host's state as one JSON document: the form that `hostsim show` prints and
// `hostsim load` reads, and from which a fresh host is made.
#pragma once

#include <nlohmann/json.hpp>

#include <cstdint>
#include <stdexcept>
#include <string>

namespace HostCtlSim {

// Objects keep their keys in insertion order, so that a document prints in a stable order.
using Json = nlohmann::ordered_json;

// A document that does not describe a host; the message names the offending key.
class DocumentError : public std::runtime_error {
  public:
    using std::runtime_error::runtime_error;
};

// The state of a fresh host: not in a cluster, one SSD and three HDDs unclaimed, no
// interfaces, no agents, no default policies, the tracing service running.
Json DefaultHost();

// A host in a cluster with `luns` disks claimed into disk groups of one SSD and up to seven
// HDDs, `agents` unicast agents and `nics` interfaces.
Json PopulatedHost(int64_t luns, int64_t agents, int64_t nics);

// Checks every key and value of `document` and returns it in canonical form: keys in their
// fixed order, UUIDs of disks and of the cluster in lower case. Throws DocumentError.
Json NormalizeHost(const Json& document);

// One interface record of the document ("network.interfaces"), canonical.
Json NormalizeInterface(const Json& record, const std::string& path);

// True iff `text` is a UUID in its 36-character text form (hexadecimal digits in either case).
bool IsUuidText(const std::string& text);
// `text` with its letters in lower case.
std::string LowerCase(std::string text);

}  // namespace HostCtlSim

namespace HostCtlSim {
// The compact JSON text of `value`; bytes that are not UTF-8 become U+FFFD instead of throwing.
inline std::string JsonText(const Json& value) {
    return value.dump(-1, ' ', false, Json::error_handler_t::replace);
}
}  // namespace HostCtlSim
