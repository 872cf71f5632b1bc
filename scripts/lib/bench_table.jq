# Prints the figures of scripts/bench as a table for each group.
def pad($width): if length < $width then . + " " * ($width - length) else . end;
def pad_left($width): if length < $width then " " * ($width - length) + . else . end;
def aim_text:
  if . == null then ""
  else to_entries[0] | (.key | split("_")) as [$what, $at, $bound] | "\($what) at \($bound) \(.value)" end;

(.figures | group_by(.group) | map({key: .[0].group, value: .}) | from_entries) as $groups
| (reduce .figures[].group as $group ([]; if index($group) then . else . + [$group] end))[] as $group
| "",
  "\($group | pad(46))\("value" | pad_left(9))       \("compared with" | pad(28))\("ratio" | pad_left(8))"
    + "\("allocations" | pad_left(13))  aim",
  ($groups[$group][]
    | "\(.title | pad(46))\("\(.value)" | pad_left(9)) \(.unit | pad(5)) "
      + "\(if .reference then "\("\(.reference_value)" | pad(7)) \(.reference)" else "" end | pad(28))"
      + "\("\(.ratio // "")" | pad_left(8))\("\(.allocations // "")" | pad_left(13))  \(.aim | aim_text)"
    | sub(" +$"; ""))
