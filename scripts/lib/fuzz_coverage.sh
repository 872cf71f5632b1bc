# Sourced by scripts/fuzz: how many lines of each folder the seeds and the inputs found so far reach.

coverage=build/coverage
minima=(src/token=95 src/xml=95 tarnik/src/xml=85 tarnik/src/http=85 tarnik/src/ssl=85 access/src/gate=80)

# replay_for_coverage NAME: writes the counters of one fuzzer
replay_for_coverage() {
  local inputs
  mapfile -t inputs < <(inputs_of "$1")
  LLVM_PROFILE_FILE=$coverage/profiles/$1.profraw "$coverage/fuzz/$1" -runs=0 \
    -artifact_prefix="$coverage/$1-" "${inputs[@]}" >"$coverage/$1.log" 2>&1 || {
    echo "$1 failed, see $coverage/$1.log" >&2
    return 1
  }
}

# measure_coverage: prints a table of the folders, with each file of a folder that is below its minimum
measure_coverage() {
  local names name programs=()
  [ $# -eq 0 ] || { echo "usage: scripts/fuzz --coverage" >&2; return 2; }
  mapfile -t names < <(list_fuzzers)
  configure_fuzzers . "$coverage" -DCMAKE_BUILD_TYPE=Debug \
    "-DCMAKE_CXX_FLAGS=-fprofile-instr-generate -fcoverage-mapping"
  build_fuzzers "$coverage" ssoclient_fuzzers
  rm -rf "$coverage/profiles"
  mkdir -p "$coverage/profiles"
  for name in "${names[@]}"; do
    replay_for_coverage "$name"
    programs+=(-object "$coverage/fuzz/$name")
  done
  llvm-profdata merge -sparse -o "$coverage/merged.profdata" "$coverage"/profiles/*.profraw
  llvm-cov export -format=lcov -instr-profile="$coverage/merged.profdata" "${programs[@]}" >"$coverage/lines.info"
  awk -v root="$PWD/" -v minima="${minima[*]}" -f scripts/lib/fuzz_coverage.awk "$coverage/lines.info"
}
