# Replaces positions in joined sources by those in the original sources: UNIT:LINE: by SOURCE:LINE:
{
  if (match($0, /^[^ :]*\/joined\/[0-9]+\.cpp:[0-9]+:/)) {
    split(substr($0, 1, RLENGTH - 1), place, ":")
    number = 0
    for (i = 1; i <= place[2] && (getline line < place[1]) > 0; ++i) {
      ++number
      if (line !~ /^#line 1 "/) continue
      source = substr(line, 10, length(line) - 10)
      number = 0
    }
    close(place[1])
    $0 = source ":" number ":" substr($0, RLENGTH + 1)
  }
  print
}
