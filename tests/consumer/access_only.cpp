// Uses no symbol of libssoclient.so and libtarnik.so, so that only libssoclient-access.so asks the
// loader for them.
#include <ssoclient/access/call_context.h>

int main() {
  const SsoClient::Access::CancellationSource source;
  source.Cancel();
  return source.Token().IsCancelled() ? 0 : 1;
}
