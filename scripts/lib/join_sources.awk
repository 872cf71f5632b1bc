# Joins the C++ sources that the input lists, sorted, into files of the folder "joined": at most 24 of one folder, and
# one that has a main function. Prints the name of each file and of its first source. "root" is the folder of the sources.
# Fails if a source does not use the name of one of its using declarations or namespace aliases, which a joined source
# with the same declaration would hide.
function append(   i) {
  print "#line 1 \"" root "/" $0 "\"" >unit
  for (i = 1; i <= lines; ++i) print line[i] >unit
}

# The name that a line declares, or an empty text.
function declared(text) {
  if (text ~ /^ *namespace [A-Za-z0-9_]* *=/) {
    sub(/^ *namespace /, "", text)
    sub(/ *=.*/, "", text)
    return text
  }
  if (text !~ /^ *using [^=]*;/ || text ~ /^ *using namespace /) return ""
  gsub(/^.*[: ]|;.*$/, "", text)
  return text
}

function is_used(name,   i, text) {
  for (i = 1; i <= lines; ++i) {
    text = line[i]
    sub(/\/\/.*/, "", text)
    if (text ~ "(^|[^A-Za-z0-9_])" name "([^A-Za-z0-9_]|$)" && declared(text) != name) return 1
  }
  return 0
}

{
  folder = $0
  sub(/\/[^\/]*$/, "", folder)
  lines = 0
  has_main = 0
  while ((getline line[lines + 1] < $0) > 0) if (line[++lines] ~ /^int main\(/) has_main = 1
  close($0)
  for (i = 1; i <= lines; ++i) {
    name = declared(line[i])
    if (name == "" || is_used(name)) continue
    print $0 ":" i ": " name " is not used" >"/dev/stderr"
    failed = 1
  }
  if (folder != last_folder || size >= 24 || (has_main && unit_has_main)) {
    if (unit != "") close(unit)
    unit = joined "/" ++units ".cpp"
    print unit " " $0
    size = 0
    unit_has_main = 0
  }
  ++size
  unit_has_main = unit_has_main || has_main
  last_folder = folder
  append()
}

END { exit failed }
