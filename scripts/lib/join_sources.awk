# Joins the C++ sources that the input lists, sorted, into files of the folder "joined": at most twelve of one folder.
# Prints the name of each file and of its first source. "root" is the folder of the sources.
function append(path,   line) {
  print "#line 1 \"" root "/" path "\"" >unit
  while ((getline line < path) > 0) print line >unit
  close(path)
}

{
  folder = $0
  sub(/\/[^\/]*$/, "", folder)
  fits = folder == last_folder && size < 12
  count = 0
  while ((getline line < $0) > 0) {
    if (line !~ /^ *(using [^=]*;|namespace [A-Za-z0-9_]* *=)|^int main\(/) continue
    declared[++count] = line
    if (line in used) fits = 0
  }
  close($0)
  if (!fits) {
    if (unit != "") close(unit)
    unit = joined "/" ++units ".cpp"
    print unit " " $0
    split("", used)
    size = 0
  }
  ++size
  last_folder = folder
  for (i = 1; i <= count; ++i) used[declared[i]] = 1
  append($0)
}
