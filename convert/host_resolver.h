// The host services ResolveServerName asks, gathered so that the name
// handling (local host, dispatch by first byte, the cut at the first dot) can
// be exercised without a name server whose answers nobody controls.
#ifndef HF_CONVERT_HOST_RESOLVER_H_
#define HF_CONVERT_HOST_RESOLVER_H_

#include <string>

struct HostResolver {
  bool (*start_sockets)();
  bool (*local_host_name)(std::string* name);
  bool (*host_by_name)(const std::string& name, std::string* official_name);
  bool (*host_by_ipv4_address)(const std::string& dotted, std::string* official_name);
};

// Puts `resolver` in place of the platform layer's services for every
// ResolveServerName that follows; null puts the platform's back. This is the
// one way a test or a fuzz target answers name lookups itself.
void UseHostResolver(const HostResolver* resolver);

#endif  // HF_CONVERT_HOST_RESOLVER_H_
