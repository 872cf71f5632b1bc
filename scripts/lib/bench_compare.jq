# Compares the figures of a run of scripts/bench with those of a stored one, $stored: by the ratios to what was measured
# beside them, since times depend on the machine, and counts of bytes and factors by themselves. A figure is worse if it
# has changed by more than $tolerance, or if there are more allocations. Prints what is worse, and ends with status 5 then.
def prefers_more: .aim // {} | keys | any(endswith("at_least"));
def comparable: if .ratio then .ratio elif .unit == "times" or .unit == "bytes" then .value else null end;

(.figures | map({key: .name, value: .}) | from_entries) as $now
| [ $stored[0].figures[] | . as $old | $now[.name] as $new
    | if $new == null then "\(.name): is missing"
      elif comparable == null then empty
      else
        (($new | comparable) / comparable | if $old | prefers_more then 1 / . else . end) as $change
        | (if $change > 1 + $tolerance
            then "\(.name): \($new | comparable), stored \(comparable), \(100 * ($change - 1) | round) % worse"
            else empty end),
          (if ($new.allocations // 0) > (.allocations // 0)
            then "\(.name): \($new.allocations) allocations, stored \(.allocations // 0)"
            else empty end)
      end ]
| "", "Compared with the run of \($stored[0].date), version \($stored[0].version):",
  (.[] | "  " + .),
  if . == [] then "  No figure is worse by more than \(100 * $tolerance) %."
  else "\(length) figures are worse.\n" | halt_error end
