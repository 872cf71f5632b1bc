# Prints the time and the memory to check a token. Input: the output of token_memory, then the CSV of check_token_bench.
FILENAME ~ /memory/ {
  split($0, word, " ")
  bytes[word[1]] = word[2]
  memory[word[1]] = word[3]
}

END {
  printf "%10s %12s %12s %12s %14s %14s %14s\n", \
    "bytes", "ours us", "peer us", "floor us", "ours/floor", "peer/ours", "memory/text"
  split("2000 6000 60000 600000", sizes, " ")
  for (i = 1; i <= 4; ++i) {
    s = sizes[i]
    ours = cpu["CheckToken/" s]
    peer = cpu["PeerCheck/" s]
    floor = cpu["FloorCheck/" s]
    if (missing("size " s, ours, peer) || missing("size " s, ours, floor)) continue
    printf "%10d %12.1f %12.1f %12.1f %14.2f %14.2f %14.2f\n", \
      bytes[s], ours, peer, floor, ours / floor, peer / ours, memory[s] / bytes[s]
  }
  print "Aims: ours/floor at most 3.5 and peer/ours at least 2.3 at 6 KB; memory/text at most 4."
  exit failed
}
