#include "convert/server_lookup.h"

#include <wx/strconv.h>

#include <cctype>
#include <string>
#include <vector>

#include "convert/host_resolver.h"
#include "platform/platform.h"
#include "server/server_process.h"

namespace {

// The socket API takes 8-bit text, one byte per character. A character
// that does not fit in one byte (or a NUL, which would end the text early)
// becomes '?', which names no host: truncating it instead could turn the
// address into the name of some other machine.
std::string ToSingleBytes(const wxString& text) {
  std::string bytes;
  bytes.reserve(text.length());
  for (wxUniChar c : text) {
    wxUint32 code = c.GetValue();
    bytes += (code == 0 || code > 0xFF) ? '?' : static_cast<char>(code);
  }
  return bytes;
}

// Host names come back in the current multibyte encoding. A name that does
// not convert is no answer; an empty name would otherwise replace the
// folder's server name.
bool FromMultibyte(const std::string& bytes, wxString* text) {
  wxString converted(bytes.c_str(), wxConvLibc);
  if (converted.empty() != bytes.empty()) return false;
  *text = converted;
  return true;
}

bool IsLocalHost(const wxString& address) {
  return address.IsSameAs("127.0.0.1", false) || address.IsSameAs("localhost", false);
}

}  // namespace

namespace {

const HostResolver kSystemResolver = {platform::StartSockets, platform::LocalHostName,
                                      platform::HostByName, platform::HostByIPv4Address};
const HostResolver* g_resolver = &kSystemResolver;

}  // namespace

void UseHostResolver(const HostResolver* resolver) {
  g_resolver = resolver ? resolver : &kSystemResolver;
}

bool ResolveServerName(const wxString& address, wxString& name) {
  const HostResolver& resolver = *g_resolver;
  if (!resolver.start_sockets()) return false;
  std::string bytes = ToSingleBytes(address);

  if (IsLocalHost(address)) {
    std::string local;
    // The local name is given whole: the server runs on this machine, and
    // its full name is what reaches it.
    if (resolver.local_host_name(&local) && FromMultibyte(local, &name)) return true;
  }

  // An empty address names nothing; it is not the all-zero address.
  if (bytes.empty()) return false;

  std::string official;
  bool found = std::isalpha(static_cast<unsigned char>(bytes[0]))
                   ? resolver.host_by_name(bytes, &official)
                   : resolver.host_by_ipv4_address(bytes, &official);
  if (!found) return false;

  wxString full;
  if (!FromMultibyte(official, &full)) return false;
  name = full.BeforeFirst('.');
  return true;
}

const wxString& CachedServerDirectory(std::optional<wxString>& cache) {
  if (!cache) {
    std::wstring directory;
    FindServerDirectory(&directory);
    cache.emplace(directory);
  }
  return *cache;
}
