# Prints the time and the memory to check a token. Input: the output of token_memory, then the CSV of check_token_bench.
FILENAME ~ /memory/ {
  split($0, word, " ")
  bytes[word[1]] = word[2]
  memory[word[1]] = word[3]
}

END {
  printf "%8s %10s %10s %10s %13s %23s %12s %12s\n", \
    "bytes", "ours us", "peer us", "floor us", "tokenizer us", "ours/(floor+tokenizer)", "peer/ours", "memory/text"
  split("2000 6000 60000 600000", sizes, " ")
  for (i = 1; i <= 4; ++i) {
    s = sizes[i]
    ours = cpu["CheckToken/" s]
    peer = cpu["PeerCheck/" s]
    floor = cpu["FloorCheck/" s]
    tokenizer = cpu["TokenizerTree/" s]
    if (missing("size " s, ours, peer) || missing("size " s, floor, tokenizer)) continue
    printf "%8d %10.1f %10.1f %10.1f %13.1f %23.2f %12.2f %12.2f\n", bytes[s], ours, peer, floor, tokenizer, \
      ours / (floor + tokenizer), peer / ours, memory[s] / bytes[s]
  }
  print "Aims: ours/(floor+tokenizer) at most 1.3 and peer/ours at least 2 up to 60 KB; memory/text at most 4."
  exit failed
}
