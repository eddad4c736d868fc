// Host names through the system resolver. POSIX sockets need no start-up.
#include <arpa/inet.h>
#include <netdb.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include "platform/platform.h"

namespace platform {

bool StartSockets() {
  return true;
}

bool LocalHostName(std::string* name) {
  char buffer[256] = {};
  if (name == nullptr || gethostname(buffer, sizeof buffer - 1) != 0) return false;
  *name = buffer;
  return !name->empty();
}

bool HostByName(const std::string& name, std::string* official_name) {
  if (official_name == nullptr || name.empty() || name.find('\0') != std::string::npos) {
    return false;
  }
  addrinfo hints = {};
  hints.ai_family = AF_INET;  // an IPv4 lookup, as the Windows call it stands for
  hints.ai_flags = AI_CANONNAME;
  addrinfo* result = nullptr;
  if (getaddrinfo(name.c_str(), nullptr, &hints, &result) != 0 || result == nullptr) return false;
  const bool found = result->ai_canonname != nullptr && *result->ai_canonname != '\0';
  if (found) *official_name = result->ai_canonname;
  freeaddrinfo(result);
  return found;
}

bool HostByIPv4Address(const std::string& dotted, std::string* official_name) {
  if (official_name == nullptr || dotted.find('\0') != std::string::npos) return false;
  const in_addr_t address = inet_addr(dotted.c_str());
  if (address == INADDR_NONE) return false;
  sockaddr_in socket_address = {};
  socket_address.sin_family = AF_INET;
  socket_address.sin_addr.s_addr = address;
  char host[NI_MAXHOST] = {};
  if (getnameinfo(reinterpret_cast<const sockaddr*>(&socket_address), sizeof socket_address, host,
                  sizeof host, nullptr, 0, NI_NAMEREQD) != 0) {
    return false;
  }
  *official_name = host;
  return true;
}

}  // namespace platform
