# Reads lcov's format and prints the line coverage of each folder of src, tarnik/src and access/src. Fails if a folder of
# `minima`, such as "src/token=95 src/xml=95", is below its percentage, and then lists its files.

# Compilers keep paths as they are given, such as /tree/build/coverage/../../src/token/principal_id.cpp.
function normalised(path) {
  while (match(path, /\/[^\/.][^\/]*\/\.\.\//)) {
    path = substr(path, 1, RSTART) substr(path, RSTART + RLENGTH)
  }
  return path
}

function percentage(reached, lines) { return lines ? 100 * reached / lines : 0 }

BEGIN {
  count = split(minima, pairs, " ")
  for (i = 1; i <= count; ++i) {
    split(pairs[i], pair, "=")
    minimum[pair[1]] = pair[2]
  }
}

/^SF:/ {
  file = normalised(substr($0, 4))
  isOurs = index(file, root) == 1
  file = isOurs ? substr(file, length(root) + 1) : ""
  isOurs = file ~ /^(src|tarnik\/src|access\/src)\/[^\/]+\//
  folder = file
  match(folder, /^(src|tarnik\/src|access\/src)\/[^\/]+/)
  folder = substr(folder, 1, RLENGTH)
}

# A line of a header is counted once, however many programs contain it.
/^DA:/ && isOurs {
  split(substr($0, 4), parts, ",")
  line = file ":" parts[1]
  if (!(line in known)) {
    known[line] = 1
    ++lines[folder]
    ++fileLines[file]
    folderOf[file] = folder
  }
  if (parts[2] > 0 && !(line in hit)) {
    hit[line] = 1
    ++reached[folder]
    ++fileReached[file]
  }
}

END {
  status = 0
  for (folder in minimum) {
    lines[folder] += 0
  }
  for (folder in lines) {
    share = percentage(reached[folder], lines[folder])
    verdict = ""
    if (folder in minimum) {
      verdict = sprintf("at least %d %%", minimum[folder])
      if (share < minimum[folder]) {
        verdict = verdict ": MISSED"
        isMissed[folder] = 1
        status = 1
      }
    }
    printf "%-24s %6d lines %6.1f %%  %s\n", folder, lines[folder], share, verdict | "sort"
  }
  close("sort")
  for (file in folderOf) {
    if (folderOf[file] in isMissed && fileReached[file] < fileLines[file]) {
      printf "  %-44s %5d of %5d lines not reached\n", file, fileLines[file] - fileReached[file], \
        fileLines[file] | "sort"
    }
  }
  close("sort")
  exit status
}
