# Sums the instructions of a callgrind profile. Prints "crypto NUMBER", those of libcrypto, and "own NUMBER", all others.
/^ob=/ {
  # A name follows the number of an object where it occurs first.
  match($0, /\([0-9]+\)/)
  id = substr($0, RSTART, RLENGTH)
  if (RSTART + RLENGTH <= length($0)) is_crypto[id] = $0 ~ /\/libcrypto\.so/
  object = is_crypto[id] ? "crypto" : "own"
  next
}
/^cob=/ {
  match($0, /\([0-9]+\)/)
  id = substr($0, RSTART, RLENGTH)
  if (RSTART + RLENGTH <= length($0)) is_crypto[id] = $0 ~ /\/libcrypto\.so/
  next
}
# The next line has the cost of the function that is called, which is counted there.
/^calls=/ { getline; next }
/^[0-9+*-]/ { sum[object == "" ? "own" : object] += $2 }
/^(summary|totals):/ { total = $2 }
END {
  if (total == "" || sum["own"] + sum["crypto"] != total) {
    print "The profile is incomplete." >"/dev/stderr"
    exit 1
  }
  printf "crypto %d\nown %d\n", sum["crypto"], sum["own"]
}
