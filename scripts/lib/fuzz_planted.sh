# Sourced by scripts/fuzz: whether the fuzzers find faults that are planted for them. Each patch in fuzz/planted plants
# one, and each line "Fuzzer: NAME" before its first hunk names a fuzzer that has to find it.

planted=build/planted

# copy_tree: copies to $planted what differs there, so that only that is compiled again
copy_tree() {
  local file
  mkdir -p "$planted"
  git ls-files -z --cached --others --exclude-standard | sort -zu | while IFS= read -r -d '' file; do
    [ -f "$file" ] || continue
    if ! cmp -s "$file" "$planted/$file"; then
      mkdir -p "$planted/$(dirname "$file")"
      cp "$file" "$planted/$file"  # without its time: it is newer than what was compiled before
    fi
  done
  (cd "$planted" && find . -path ./build -prune -o -type f -printf '%P\0') | while IFS= read -r -d '' file; do
    [ -f "$file" ] || rm "$planted/$file"
  done
}

# apply_patch PATCH [OPTION...]: in the copy, which Git must not take for a part of this repository
apply_patch() { GIT_CEILING_DIRECTORIES=$PWD/build git -C "$planted" apply "${@:2}" "$PWD/$1"; }

# fuzzers_of PATCH
fuzzers_of() { sed -n 's/^Fuzzer: //p;/^diff /q' "$1"; }

# build_planted TARGET...: The paths in the commands are those of build/fuzz, so that ccache knows what is unchanged.
build_planted() {
  CCACHE_BASEDIR=${CCACHE_BASEDIR-$PWD} CCACHE_NOHASHDIR=1 build_fuzzers "$planted/build/fuzz" "$@" \
    >"$planted/build.log" 2>&1 || { tail -n 40 "$planted/build.log" >&2; return 1; }
}

# list_patches BEGINNING...: those whose names begin so; all if none is given
list_patches() {
  local beginning
  for beginning in "${@:-}"; do
    compgen -G "fuzz/planted/$beginning*.patch" || { echo "There is no patch $beginning." >&2; return 1; }
  done | sort -u
}

# replay_unchanged NAME...: Without a fault, no input may fail.
replay_unchanged() {
  local name inputs
  for name in "$@"; do
    mapfile -t inputs < <(inputs_of "$name")
    "$planted/build/fuzz/fuzz/$name" -runs=0 -artifact_prefix="$planted/$name-" "${inputs[@]}" \
      >"$planted/$name.log" 2>&1 || {
      echo "$name fails without a planted fault, see $planted/$name.log" >&2
      return 1
    }
  done
}

# seek_fault PATCH NAME SECONDS: prints a line of the table; false unless the fault is found
seek_fault() {
  local patch=$1 name=$2 seconds=$3 number inputs folder begin verdict status=0 runs
  number=$(basename "$patch" .patch)
  folder=$planted/found/$number-$name
  rm -rf "$folder"
  mkdir -p "$folder/corpus"
  mapfile -t inputs < <(inputs_of "$name")
  begin=$SECONDS
  run_fuzzer "$planted/build/fuzz/fuzz/$name" "$seconds" "$folder/" -seed=1 "$folder/corpus" "${inputs[@]}" \
    >"$folder/log" 2>&1 || status=$?
  verdict="NOT FOUND"
  if [ "$status" -ne 0 ] && compgen -G "$folder/*-*" >/dev/null; then
    verdict=found
  fi
  runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$folder/log")
  printf '%-44s %-24s %-9s %5d s %9s runs\n' "$number" "$name" "$verdict" $((SECONDS - begin)) "${runs:-?}"
  rm -rf "$folder/corpus"
  [ "$verdict" = found ]
}

# plant_and_seek PATCH SECONDS
plant_and_seek() {
  local names name status=0
  mapfile -t names < <(fuzzers_of "$1")
  apply_patch "$1" || { echo "$1 does not apply" >&2; return 1; }
  if build_planted "${names[@]/#/ssoclient_}"; then
    for name in "${names[@]}"; do
      seek_fault "$1" "$name" "$2" || status=1
    done
  else
    status=1
  fi
  apply_patch "$1" -R
  return "$status"
}

# find_planted_faults [--seconds N] [BEGINNING...]
find_planted_faults() {
  local seconds=60 patch patches names missed=()
  if [ "${1-}" = --seconds ]; then
    seconds=${2:?}
    shift 2
  fi
  mapfile -t patches < <(list_patches "$@")
  mapfile -t names < <(for patch in "${patches[@]}"; do fuzzers_of "$patch"; done | sort -u)
  [ "${#names[@]}" -gt 0 ] || return 1
  copy_tree
  configure_fuzzers "$planted" "$planted/build/fuzz" "${sanitized[@]}"
  build_planted "${names[@]/#/ssoclient_}"
  replay_unchanged "${names[@]}"
  for patch in "${patches[@]}"; do
    plant_and_seek "$patch" "$seconds" || missed+=("$(basename "$patch" .patch)")
  done
  echo "$((${#patches[@]} - ${#missed[@]})) of ${#patches[@]} planted faults found"
  [ "${#missed[@]}" -eq 0 ] || { echo "Not found: ${missed[*]}; see $planted/found" >&2; return 1; }
}
