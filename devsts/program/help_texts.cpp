#include "help_texts.h"

#include "assertion_names.h"
#include "commands.h"
#include "misbehavior_names.h"
#include "tls_names.h"
#include "vocabulary.h"

namespace DevSts::Program {

std::string HelpBeforeOptions() {
  return "Example:\n"
         "  ssoclient-devsts --background --state sts --control sts/control --ready-file "
         "sts/ready\n"
         "  ssoclient-devsts control sts/control quit\n"
         "\n"
         "A small Security Token Service (WS-Trust 1.3) FOR TESTS ONLY. Its keys and passwords\n"
         "protect nothing, and it misbehaves on request.";
}

std::string HelpAfterOptions() {
  return "Output:\n"
         "  The first lines are http_url=... and https_url=...; with a Kerberos realm, the lines\n"
         "  krb5_config=, krb5_cache= and service= follow; then the line ready, and a line for "
         "each\n"
         "  request. Lines that nobody reads are dropped after a megabyte, and requests-lost=N "
         "counts\n"
         "  them. Standard error says that the service is for tests only.\n"
         "\n"
         "Users:\n"
         "  Without --accounts: alice@EXAMPLE.COM (password secret), bob@EXAMPLE.COM "
         "(bob-secret),\n"
         "  expired@EXAMPLE.COM (expired-secret, which has expired), and machine@EXAMPLE.COM\n"
         "  (machine-secret), to whom client.pem belongs.\n"
         "\n"
         "Exit status:\n"
         "  0  ended on request, by a signal, the command quit or the end of standard input\n"
         "  1  another failure, such as a port that accepts no more connections; for control, an "
         "error\n"
         "     in the answer or no service\n"
         "  2  wrong options, or a wrong line in the accounts file\n"
         "  3  a port is in use or cannot be opened\n"
         "  4  a file or folder is missing, in use, broken or cannot be written\n";
}

std::string MisbehaviorHelp() {
  return "--misbehave NAME[=VALUE], and the command misbehave. Names can be combined. TEXT has "
         "the\n"
         "escapes \\r, \\n, \\t, \\\\ and \\xHH; TIME is such as 500ms, 2s, 5m, 1h or 30d.\n"
         "CODE is PREFIX:NAME with the prefix soap, wst, wsse or wsu, such as wst:RequestFailed;\n"
         "{NAMESPACE}NAME; or NAME, which is in no namespace. /FROM/TO/ may have another "
         "character\n"
         "in place of the slash, such as |FROM|TO|.\n" +
         Describe(MisbehaviorNames()) +
         "\n--tls NAME[=VALUE], and the command tls. One kind of certificate, one range of "
         "protocols:\n" +
         Describe(TlsNames()) + "\n--assertion NAME=VALUE, and the command assertion:\n" +
         Describe(AssertionNames()) +
         "\n--negotiation NAME[=VALUE], and the command negotiation, for Kerberos logins:\n" +
         Describe(NegotiationNames());
}

std::string ControlHelp() {
  return "ssoclient-devsts control PATH COMMAND... sends a command to the socket of --control "
         "PATH.\n"
         "A client of the socket sends one command in a line and receives one line, \"ok ...\" or\n"
         "\"error ...\". Words are separated by spaces; a word in quotation marks may contain "
         "spaces,\n"
         "and \\\" and \\\\.\n" +
         Commands::Help();
}

std::string AccountsHelp() {
  return "# The form of --accounts FILE. This text is such a file. Its passwords are for tests "
         "only.\n"
         "# A line is a section, KEY = VALUE or a comment. Paths are relative to the file.\n"
         "\n"
         "[service]\n"
         "# Starts a Kerberos realm, EXAMPLE.COM, like --realm; its users are those of this "
         "domain:\n"
         "realm = yes\n"
         "# The name of the service in the realm (default: HTTP/localhost):\n"
         "principal = HTTP/localhost\n"
         "# A folder that receives NAME.keytab for each user of the realm:\n"
         "user-keytabs = keytabs\n"
         "# In place of realm: the keys of a service of the realm that KRB5_CONFIG describes:\n"
         "# keytab = service.keytab\n"
         "\n"
         "[user alice@EXAMPLE.COM]\n"
         "# Without a password, the user cannot log in by password:\n"
         "password = secret\n"
         "group = EXAMPLE\\staff\n"
         "group = EXAMPLE\\admins\n"
         "given-name = Alice\n"
         "surname = Archer\n"
         "# A certificate with whose key the user logs in; may be repeated:\n"
         "# certificate = alice.pem\n"
         "# A Kerberos principal that logs in as this user; may be repeated:\n"
         "principal = alice/web@EXAMPLE.COM\n"
         "\n"
         "[user expired@EXAMPLE.COM]\n"
         "password = expired-secret\n"
         "password-expired = yes\n"
         "\n"
         "[user machine@EXAMPLE.COM]\n"
         "solution = yes\n"
         "# Owns client.pem, which the service makes; one user at most:\n"
         "client-certificate = yes\n";
}

std::string VersionText() {
  return "ssoclient-devsts " DEVSTS_VERSION "\n";
}

}  // namespace DevSts::Program
