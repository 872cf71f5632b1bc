# Prints the time of calls of a token source. Input: the outputs of token_hits and token_refresh, then the CSV of
# token_source_bench.
FILENAME !~ /csv/ {
  split($0, word, " ")
  if (word[1] == "hit") {
    time[word[2]] = word[3]
    allocations[word[2]] = word[4]
  } else {
    time[word[1]] = word[2]
    more[word[1]] = word[3]
  }
}

function hit_row(title, name) {
  if (missing(title, time[name], allocations[name])) return
  printf "%-40s %10.0f %14d\n", title, time[name], allocations[name]
}

END {
  printf "\n%-40s %10s %14s\n", "a token from the cache of a source", "ns", "allocations"
  hit_row("two audiences", "2_audiences")
  hit_row("ten audiences", "10_audiences")
  hit_row("on behalf of a token of 6 KB", "act_as")
  hit_row("the same with a copy of that token", "act_as_copy")
  hit_row("one of a thousand keys, in turn", "1000_keys")
  if (!missing("two threads", time["threads"], more["threads"]))
    printf "%-40s %10.0f %14s\n", "two threads, two audiences", time["threads"], "x " more["threads"]
  print "Aims: at most 200 ns without an allocation; two threads make 1.9 times as many calls as one."

  printf "\n%-40s %10s %10s %13s %12s %12s %13s\n", "a token by password, kept connection", "source us", "client us", \
    "source/client", "source CPU", "client CPU", "source/client"
  if (!missing("kept connection", real["BySource"], real["ByClient"]))
    printf "%-40s %10.1f %10.1f %13.2f %12.1f %12.1f %13.2f\n", "from the dev STS, over TLS", real["BySource"], \
      real["ByClient"], real["BySource"] / real["ByClient"], cpu["BySource"], cpu["ByClient"], \
      cpu["BySource"] / cpu["ByClient"]
  print "Aim: source/client at most 1.05."

  printf "\n%-40s %10s %14s\n", "a source of a thousand keys", "us", "bytes"
  if (!missing("a thousand keys", time["refresh"], time["memory"]))
    printf "%-40s %10.1f %14d\n", "each refresh and key, less their token", time["refresh"], time["memory"]
  exit failed
}
