# Sourced by scripts/abi.

# write_abi LIBRARY HEADERS FILE: writes the interface of a library with debug information: what its symbols lead to, with
# the types of other libraries, since smart pointers lead to interfaces. What is not in the headers in the folder HEADERS
# is private, and what a path or line decides is left out.
write_abi() {
  abidw --headers-dir "$2" --drop-private-types --exported-interfaces-only --no-show-locs --no-comp-dir-path \
    --no-corpus-path --out-file "$3" "$1"
}

# compare_abi BASELINE FILE: reports what programs that use the first interface may find changed in the second. Returns 0
# if it is nothing; new functions do not matter to them.
compare_abi() { abidiff --no-added-syms --no-show-locs "$1" "$2"; }

# try_changes FOLDER WORK: whether compare_abi finds the changes of the library in the folder that it has to find, and no
# others. Returns 1 after a message if it does not.
try_changes() {
  local change status failed=0
  local breaking=(MEMBER_REPLACED MEMBER_ADDED VIRTUALS_SWAPPED VIRTUAL_REMOVED INTERFACE_FUNCTION_REMOVED FUNCTION_REMOVED)
  local harmless=(NOTHING FUNCTION_ADDED HIDDEN_MEMBER_ADDED)
  # write_changed CHANGE
  write_changed() {
    c++ -std=c++17 -g -O2 -shared -fPIC -fvisibility=hidden -I"$1/include" "-DEXAMPLE_$3" "$1/src/shape.cpp" \
      -Wl,-soname,libshape.so.1 -o "$2/libshape.so"
    write_abi "$2/libshape.so" "$1/include" "$2/$3.abi"
  }
  for change in "${harmless[@]}" "${breaking[@]}"; do
    write_changed "$1" "$2" "$change"
    status=0
    compare_abi "$2/NOTHING.abi" "$2/$change.abi" >"$2/$change.log" || status=$?
    case " ${harmless[*]} " in
      *" $change "*) [ "$status" -eq 0 ] || { echo "reported although it breaks nothing: $change"; failed=1; } ;;
      # A change, or one that is surely incompatible. Other values are errors of the comparison itself.
      *) [[ $status =~ ^(4|12)$ ]] || { echo "not reported: $change"; failed=1; } ;;
    esac
  done
  return $failed
}
