# Reads the best repetition of each benchmark from the CSV output of Google Benchmark: cpu[NAME] and real[NAME] in the
# unit of the benchmark.
BEGIN { FS = "," }

/^"?name"?,/ {
  for (i = 1; i <= NF; ++i) {
    gsub(/"/, "", $i)
    column[$i] = i
  }
  next
}

# Aggregates of the repetitions have a name that ends like this.
/^"[^"]*_(mean|median|stddev|cv)"/ { next }

"cpu_time" in column {
  # The name also says how the time is measured.
  name = $1
  gsub(/"|\/process_time|\/real_time|\/repeats:[0-9]*|\/iterations:[0-9]*/, "", name)
  keep_smaller(cpu, name, $column["cpu_time"])
  keep_smaller(real, name, $column["real_time"])
}

function keep_smaller(values, name, value) {
  if (value != "" && (!(name in values) || value + 0 < values[name] + 0)) values[name] = value
}

# Returns whether a value is missing, and if so, prints a message for the row TITLE of a table.
function missing(title, first, second) {
  if (first != "" && second != "") return 0
  print title ": no result, see build/bench.log"
  failed = 1
  return 1
}
