# Makes the figures of scripts/bench from the outputs of the programs in bench/. The format is described in
# docs/benchmarks.md. Variables: the JSON of the programs with Google Benchmark (check, sign, source and exchange), the
# lines of the others (memory, hits, refresh and gate), and what describes the run.

# The best repetition of a benchmark.
def best($run; $name; $time):
  [$run[0].benchmarks[]
    | select(.run_type == "iteration" and (.name | sub("/(iterations|repeats|process_time|real_time).*"; "")) == $name)
    | if .error_occurred then error("\($name): \(.error_message)") else .[$time] end]
  | min // error("there is no result of \($name)");
def cpu($run; $name): best($run; $name; "cpu_time");
def real($run; $name): best($run; $name; "real_time");

# The words of the line that begins with these words, without them.
def words($text; $first):
  first(($text | split("\n")[] | split(" ") | select(.[:$first | length] == $first) | .[$first | length:]),
    error("there is no line \($first | join(" "))"));
def number($text; $first; $index): words($text; $first)[$index] | tonumber;

# At least four digits.
def rounded:
  if . == 0 or fabs >= 1000 then round
  else pow(10; 3 - (fabs | log10 | floor)) as $scale | . * $scale | round / $scale end;
def size_text:
  . / 1000 | if . < 10 then . * 10 | round / 10 else round end | "\(.) KB";

def figure($name; $group; $title; $unit; $value): {$name, $group, $title, $unit, value: $value};
def compared($reference; $value): . + {reference: $reference, reference_value: $value, ratio: (.value / $value)};
def aiming($aim): . + {aim: $aim};

def token_checks:
  (2000, 6000, 60000, 600000) as $size
  | number($memory; ["\($size)"]; 0) as $bytes
  | cpu($check; "CheckToken/\($size)") as $ours
  | figure("check_token/\($size)"; "checking a token"; $bytes | size_text; "us"; $ours)
    | compared("floor and tokenizer"; cpu($check; "FloorCheck/\($size)") + cpu($check; "TokenizerTree/\($size)"))
    | if $size <= 60000 then aiming({ratio_at_most: 1.3}) else . end;
def peer_checks:
  (2000, 6000, 60000, 600000) as $size
  | figure("peer_check/\($size)"; "checking a token"; "\(number($memory; ["\($size)"]; 0) | size_text), by xmlsec1"; "us";
      cpu($check; "PeerCheck/\($size)"))
    | compared("ours"; cpu($check; "CheckToken/\($size)"))
    | if $size <= 60000 then aiming({ratio_at_least: 2}) else . end;
def token_memory:
  (2000, 6000, 60000, 600000) as $size
  | number($memory; ["\($size)"]; 0) as $bytes
  | figure("token_memory/\($size)"; "memory of a token"; $bytes | size_text; "bytes";
      number($memory; ["\($size)"]; 1))
    | compared("its text"; $bytes) | aiming({ratio_at_most: 4});
def signed_requests:
  (["CertificateRequest", "certificate", "by certificate"],
    ["TokenRequest/6000", "token", "by token of 6 KB"],
    ["SignRequest/2000", "signature", "only the signature, of 2 KB"]) as [$run, $name, $title]
  | figure("signed_request/\($name)"; "signed requests"; $title; "us"; cpu($sign; $run))
    | compared("one RSA signature"; cpu($sign; "FloorSign")) | aiming({ratio_at_most: 1.1});
def exchanges:
  (["new", "full TLS handshakes"], ["resumed", "resumed TLS sessions"]) as [$kind, $title]
  | (figure("exchange/\($kind)"; "a token by password"; $title; "us"; real($exchange; "AcquireToken/\($kind)"))
      | compared("bare client"; real($exchange; "BareExchange/\($kind)")) | aiming({ratio_at_most: 1.2})),
    (figure("exchange_cpu/\($kind)"; "a token by password"; "\($title), processor time"; "us";
        cpu($exchange; "AcquireToken/\($kind)"))
      | compared("bare client"; cpu($exchange; "BareExchange/\($kind)"))
      | if $kind == "resumed" then aiming({ratio_at_most: 1.5}) else . end);
def sources:
  (figure("source/kept"; "a token by password"; "token source, kept connection"; "us"; real($source; "BySource"))
    | compared("client"; real($source; "ByClient")) | aiming({ratio_at_most: 1.05})),
  (figure("source_cpu/kept"; "a token by password"; "token source, kept connection, processor time"; "us";
      cpu($source; "BySource"))
    | compared("client"; cpu($source; "ByClient")));
def hits:
  (["2_audiences", "two audiences"], ["10_audiences", "ten audiences"], ["act_as", "on behalf of a token of 6 KB"],
    ["act_as_copy", "the same with a copy of that token"], ["1000_keys", "one of a thousand keys, in turn"])
    as [$name, $title]
  | figure("cached_token/\($name)"; "a token from the cache"; $title; "ns"; number($hits; ["hit", $name]; 0))
    | compared("the two clocks"; number($hits; ["clocks"]; 0)) | aiming({value_at_most: 200})
    | . + {allocations: number($hits; ["hit", $name]; 1)};
def hits_of_two_threads:
  figure("cached_token_threads/two"; "a token from the cache"; "calls of two threads"; "times";
    number($hits; ["threads"]; 1)) | aiming({value_at_least: 1.9});
def refreshes:
  figure("thousand_keys/refresh"; "a source of a thousand keys"; "each refresh, less its exchange"; "us";
    number($refresh; ["refresh"]; 0)),
  figure("thousand_keys/memory"; "a source of a thousand keys"; "each key, less its token"; "bytes";
    number($refresh; ["memory"]; 0));
def gates:
  (2000, 6000, 60000) as $size
  | figure("gate/\($size)"; "token gate"; "\(number($gate; ["gate", "\($size)"]; 0) | size_text), remembered"; "ns";
      number($gate; ["gate", "\($size)"]; 2))
    | compared("read"; number($gate; ["gate", "\($size)"]; 1))
    | if $size == 6000 then aiming({ratio_at_most: 0.1}) else . end
    | . + {allocations: number($gate; ["gate", "\($size)"]; 3)};
def gate_memory:
  (2000, 6000, 60000) as $size
  | figure("gate_memory/\($size)"; "token gate";
      "\(number($gate; ["memory", "\($size)"]; 0) | size_text), memory"; "bytes";
      number($gate; ["memory", "\($size)"]; 1))
    | compared("counted"; number($gate; ["memory", "\($size)"]; 2)) | aiming({ratio_at_most: 1});
def gate_threads:
  (["threads", "checks of two threads, a token each"], ["same", "checks of two threads, one token"]) as [$name, $title]
  | figure("gate_threads/\($name)"; "token gate"; $title; "times"; number($gate; [$name]; 1))
    | aiming({value_at_least: 1.9});

[token_checks, peer_checks, token_memory, signed_requests, exchanges, sources, hits, hits_of_two_threads, refreshes,
  gates, gate_memory, gate_threads]
| map((.value, .reference_value, .ratio | values) |= rounded)
| {format: 1, $date, $version, $compiler, $openssl, $system, machine: {$processor, $cores}, figures: .}
