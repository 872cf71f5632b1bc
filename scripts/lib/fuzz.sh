# Sourced by scripts/fuzz: building and running fuzzers.

sanitized=(-DCMAKE_BUILD_TYPE=RelWithDebInfo -DSSOCLIENT_SANITIZER=address,undefined)

# configure_fuzzers SOURCE BUILD OPTION...
configure_fuzzers() {
  local launcher=()
  command -v ccache >/dev/null && launcher=(-DCMAKE_CXX_COMPILER_LAUNCHER=ccache)
  cmake -S "$1" -B "$2" -G Ninja -DCMAKE_CXX_COMPILER=clang++ -DSSOCLIENT_BUILD_FUZZERS=ON "${launcher[@]}" \
    "${@:3}" >/dev/null
}

# build_fuzzers BUILD TARGET...: with two jobs, unless CMAKE_BUILD_PARALLEL_LEVEL says otherwise
build_fuzzers() { cmake --build "$1" --target "${@:2}" "-j${CMAKE_BUILD_PARALLEL_LEVEL:-2}"; }

# list_fuzzers: the name of each fuzzer
list_fuzzers() {
  local source
  for source in fuzz/*_fuzz.cpp; do
    basename "$source" .cpp
  done
}

# dictionary_of NAME: the option with a fuzzer's dictionary, if it has one
dictionary_of() {
  case $1 in
    canonicalizer_fuzz | response_handler_fuzz | token_reader_fuzz) echo "-dict=fuzz/xml.dict" ;;
    connection_specs_fuzz | http_calls_fuzz | tls_client_fuzz) echo "-dict=fuzz/words.dict" ;;
  esac
}

# inputs_of NAME: the folders of the seeds and of the inputs found so far
inputs_of() {
  local folder
  for folder in "fuzz/seeds/$1" "build/fuzz/corpus/$1"; do
    [ ! -d "$folder" ] || echo "$folder"
  done
}

# run_fuzzer PROGRAM SECONDS ARTIFACT_PREFIX CORPUS...: new inputs are kept in the first folder.
run_fuzzer() {
  local dictionary
  dictionary=$(dictionary_of "$(basename "$1")")
  "$1" -max_total_time="$2" -timeout=20 -rss_limit_mb=4096 -print_final_stats=1 -artifact_prefix="$3" \
    ${dictionary:+"$dictionary"} "${@:4}"
}
