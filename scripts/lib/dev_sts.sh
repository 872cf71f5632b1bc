# Sourced by scripts that run the dev STS in the background. The dev STS reads its commands from a pipe that stays open
# until the script ends for any reason, and ends when the pipe is closed.

# open_dev_sts_commands FOLDER: opens the pipe for all dev STSs of the script as file descriptor 3. Other children of
# the script must be started with 3>&-, or they keep the dev STS running.
open_dev_sts_commands() {
  dev_sts_commands=$1/commands
  mkfifo "$dev_sts_commands"
  exec 3<>"$dev_sts_commands"
}

# start_dev_sts PROGRAM LOG OPTION...: appends the output of the dev STS to LOG and sets dev_sts_pid.
start_dev_sts() {
  : >"$2"  # await_dev_sts may read it before the dev STS writes
  "$1" --end-with-stdin "${@:3}" >>"$2" <"$dev_sts_commands" 3>&- &
  dev_sts_pid=$!
}

# await_dev_sts LOG PATTERN: waits at most half a minute until a line of LOG matches PATTERN.
await_dev_sts() {
  local tries
  for ((tries = 0; tries < 600; ++tries)); do
    grep -q -E "$2" "$1" && return
    kill -0 "$dev_sts_pid" 2>/dev/null || break
    sleep 0.05
  done
  grep -q -E "$2" "$1"
}

# print_dev_sts_value LOG NAME: the value in the line NAME=VALUE, which the dev STS prints when it starts
print_dev_sts_value() { sed -n "s/^$2=//p" "$1"; }
