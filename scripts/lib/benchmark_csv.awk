# Reads medians from the CSV output of Google Benchmark: cpu[NAME] and real[NAME] in the unit of the benchmark.
BEGIN { FS = "," }

/^"?name"?,/ {
  for (i = 1; i <= NF; ++i) {
    gsub(/"/, "", $i)
    column[$i] = i
  }
  next
}

/_median/ {
  # The name also says how the time is measured.
  name = $1
  gsub(/"|_median|\/process_time|\/real_time/, "", name)
  cpu[name] = $column["cpu_time"]
  real[name] = $column["real_time"]
}

# Returns whether a value is missing, and if so, prints a message for the row TITLE of a table.
function missing(title, first, second) {
  if (first != "" && second != "") return 0
  print title ": no result, see build/bench.log"
  failed = 1
  return 1
}
