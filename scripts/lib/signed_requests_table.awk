# Prints the time to make signed requests. Input: the CSV of sign_request_bench.
function row(title, name) {
  if (missing(title, cpu[name], cpu["FloorSign"])) return
  printf "%-50s %12.1f %12.1f %14.2f\n", title, cpu[name], cpu["FloorSign"], cpu[name] / cpu["FloorSign"]
}

END {
  printf "\n%-50s %12s %12s %14s\n", "signed requests", "ours us", "floor us", "ours/floor"
  row("by certificate", "CertificateRequest")
  row("by token of 6 KB", "TokenRequest/6000")
  row("only the signature, of 2 KB", "SignRequest/2000")
  print "Aim: ours/floor at most 1.1."
  exit failed
}
