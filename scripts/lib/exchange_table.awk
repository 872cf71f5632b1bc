# Prints the time to acquire a token. Input: the CSV of exchange_bench.
function row(title, kind,   ours, bare) {
  ours = real["AcquireToken/" kind]
  bare = real["BareExchange/" kind]
  if (missing(title, ours, bare)) return
  printf "%-50s %12.1f %12.1f %14.2f %14.1f %14.1f\n", title, ours, bare, ours / bare, \
    cpu["AcquireToken/" kind], cpu["BareExchange/" kind]
}

END {
  printf "\n%-50s %12s %12s %14s %14s %14s\n", "a token by password, from the dev STS", "ours us", "bare us", "ours/bare", \
    "our CPU us", "bare CPU us"
  row("full TLS handshakes", "new")
  row("resumed TLS sessions", "resumed")
  print "Aim: ours/bare at most 1.2."
  exit failed
}
