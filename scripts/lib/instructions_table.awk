# Compares counts of instructions with the stored ones. Input: bench/instructions.txt, then the counts of this system, both
# as lines "SYSTEM OPERATION PART NUMBER". Fails if a count has grown by more than 15 % or is not stored.
/^#/ { next }
FILENAME ~ /instructions\.txt$/ {
  if ($1 == here) stored[$2 " " $3] = $4
  next
}
{
  name[++rows] = $2
  part[rows] = $3
  count[rows] = $4
}

END {
  printf "%-20s %-8s %14s %14s %10s\n", "instructions", "", "now", "stored", "change"
  for (i = 1; i <= rows; ++i) {
    key = name[i] " " part[i]
    if (!(key in stored)) {
      printf "%-20s %-8s %14d  is not stored for %s; scripts/instructions --renew stores it\n", name[i], part[i], \
        count[i], here
      failed = 1
      continue
    }
    change = 100 * (count[i] / stored[key] - 1)
    verdict = ""
    if (change > 15) {
      verdict = "  MORE THAN 15 %"
      failed = 1
    } else if (change < -15) {
      verdict = "  renew the stored count"
    }
    printf "%-20s %-8s %14d %14d %9.1f%%%s\n", name[i], part[i], count[i], stored[key], change, verdict
  }
  if (rows == 0) {
    print "Nothing was counted." >"/dev/stderr"
    failed = 1
  }
  exit failed
}
