// Uses no symbol of libtarnik.so, so that only libssoclient.so asks the loader for it.
#include <ssoclient/principal_id.h>

int main() {
  const SsoClient::PrincipalId left = {"alice", "EXAMPLE.COM"};
  const SsoClient::PrincipalId right = {"Alice", "example.com"};
  return left == right ? 0 : 1;
}
