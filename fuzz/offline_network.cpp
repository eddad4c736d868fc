// Name lookups answered from a small table instead of the system resolver.
// A fuzzed folder.cfg names arbitrary servers; asking real name servers for
// them would make every run as slow and as unrepeatable as the network, and
// send junk queries to it. The target that links this file puts the table in
// place before its first input.
#include <string>

#include "convert/host_resolver.h"

namespace {

// A few hosts by name or dotted address, with their official names.
bool Look(const std::string& name, std::string* official) {
  if (name == "press-01" || name == "PRESS-01") *official = "press-01.print.example";
  if (name == "10.0.0.5") *official = "press-05.print.example";
  return name == "press-01" || name == "PRESS-01" || name == "10.0.0.5";
}

const HostResolver kOfflineResolver = {
    [] { return true; },
    [](std::string* name) {
      *name = "fuzzhost.print.example";
      return true;
    },
    Look,
    Look,
};

// Runs at start-up. The pointer it sets is constant-initialised, before any
// start-up code runs, so the order of start-up does not matter.
[[maybe_unused]] const bool kInPlace = (UseHostResolver(&kOfflineResolver), true);

}  // namespace
