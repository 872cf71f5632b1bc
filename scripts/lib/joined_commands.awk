# Prints compile commands for joined sources. Input: the output of join_sources.awk, then CMake's compile_commands.json.
FILENAME !~ /\.json$/ {
  unit_of["\"" root "/" $2 "\""] = root "/" $1
  next
}
/^ *"directory":/ { directory = $0 }
/^ *"command":/ { command = $0 }
/^ *"file":/ {
  source = $0
  gsub(/^ *"file": *|,? *$/, "", source)
  if (!(source in unit_of)) next
  unit = unit_of[source]
  # A source also finds the headers of its own folder.
  folder = source
  gsub(/^"|\/[^\/]*$/, "", folder)
  sub(/ -c [^ ]*",? *$/, " -iquote " folder " -c " unit "\",", command)
  print (printed++ ? "," : "[") "{\n" directory "\n" command "\n  \"file\": \"" unit "\"\n}"
}
END { print "]" }
