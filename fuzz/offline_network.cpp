// The name services of the platform layer, answered from a small table
// instead of the system resolver. A fuzzed folder.cfg names arbitrary
// servers; asking real name servers for them would make every run as slow
// and as unrepeatable as the network, and send junk queries to it.
//
// The fuzz target that links this file gets these definitions instead of
// the platform library's posix_network.cpp, which the linker then has no
// reason to pull in.
#include <cstddef>
#include <string>

#include "platform/platform.h"

namespace platform {
namespace {

struct KnownHost {
  const char* name;  // as looked up: a host name or a dotted address
  const char* official;
};

const KnownHost kKnownHosts[] = {
    {"press-01", "press-01.print.example"},
    {"PRESS-01", "press-01.print.example"},
    {"10.0.0.5", "press-05.print.example"},
    {"192.168.1.20", "rip.print.example"},
};

bool Look(const std::string& name, std::string* official) {
  for (const KnownHost& host : kKnownHosts) {
    if (name == host.name) {
      *official = host.official;
      return true;
    }
  }
  return false;
}

}  // namespace

bool StartSockets() {
  return true;
}

bool LocalHostName(std::string* name) {
  *name = "fuzzhost.print.example";
  return true;
}

bool HostByName(const std::string& name, std::string* official_name) {
  return Look(name, official_name);
}

bool HostByIPv4Address(const std::string& dotted, std::string* official_name) {
  return Look(dotted, official_name);
}

}  // namespace platform
