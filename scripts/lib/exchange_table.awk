# Prints the time to acquire a token. Input: the CSV of exchange_bench.
function row(title, kind,   ours, bare) {
  ours = real["AcquireToken/" kind]
  bare = real["BareExchange/" kind]
  if (missing(title, ours, bare)) return
  our_cpu = cpu["AcquireToken/" kind]
  bare_cpu = cpu["BareExchange/" kind]
  printf "%-40s %10.1f %10.1f %12.2f %12.1f %12.1f %13.2f\n", title, ours, bare, ours / bare, our_cpu, bare_cpu, \
    our_cpu / bare_cpu
}

END {
  printf "\n%-40s %10s %10s %12s %12s %12s %13s\n", "a token by password, from the dev STS", "ours us", "bare us", \
    "ours/bare", "our CPU us", "bare CPU us", "CPU ours/bare"
  row("full TLS handshakes", "new")
  row("resumed TLS sessions", "resumed")
  print "Aims: ours/bare at most 1.2; CPU ours/bare at most 1.5 with resumed sessions."
  exit failed
}
