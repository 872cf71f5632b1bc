#include "accounts_file.h"

#include <algorithm>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string_view>
#include <utility>

#include "devsts/kerberos_realm.h"
#include "errors.h"
#include "files.h"
#include "signing/certificates.h"
#include "value_forms.h"
#include "xml/schema_values.h"

namespace DevSts::Program {
namespace {

constexpr char kDemoClientUser[] = "machine@EXAMPLE.COM";

std::string Trimmed(const std::string& text) {
  constexpr char kSpace[] = " \t";
  const std::size_t begin = text.find_first_not_of(kSpace);
  if (begin == std::string::npos) {
    return {};
  }
  return text.substr(begin, text.find_last_not_of(kSpace) - begin + 1);
}

bool HasControlCharacter(const std::string& text) {
  return std::any_of(text.begin(), text.end(), [](char character) {
    return (character >= '\0' && character < ' ' && character != '\t') || character == '\x7f';
  });
}

// What the tokens, which are UTF-8, cannot contain.
void RequirePlainText(const std::string& text) {
  if (HasControlCharacter(text)) {
    throw std::invalid_argument("there is a control character in this line");
  }
  if (!IsUtf8(text)) {
    throw std::invalid_argument("this line is not UTF-8");
  }
}

// Editors of some systems write a byte order mark.
std::string WithoutMark(const std::string& text) {
  constexpr std::string_view kMark = "\xef\xbb\xbf";
  return text.compare(0, kMark.size(), kMark) == 0 ? text.substr(kMark.size()) : text;
}

std::string FolderOf(const std::string& path) {
  const std::size_t slash = path.rfind('/');
  return slash == std::string::npos ? "" : path.substr(0, slash + 1);
}

// Reads the lines one after another. Every function throws std::invalid_argument.
class Reader {
 public:
  explicit Reader(const std::string& path) : folder_(FolderOf(path)) {}

  void Take(const std::string& line, unsigned number) {
    number_ = number;
    RequirePlainText(line);
    const std::string text = Trimmed(line);
    if (text.empty() || text[0] == '#' || text[0] == ';') {
      return;
    }
    if (text[0] == '[') {
      BeginSection(text);
    } else {
      TakeKey(text);
    }
  }

  AccountsFile Finish() {
    if (accounts_.users.empty()) {
      throw std::invalid_argument("there is no section [user NAME@DOMAIN]");
    }
    if (accounts_.startsRealm && !accounts_.keytab.empty()) {
      throw std::invalid_argument("realm = yes and keytab exclude each other");
    }
    return std::move(accounts_);
  }

 private:
  enum class Section { None, Service, User };

  void BeginSection(const std::string& text) {
    constexpr std::size_t kPrefixSize = 6;
    seen_.clear();
    if (text == "[service]") {
      if (std::exchange(hasService_, true)) {
        throw std::invalid_argument("there is a second section [service]");
      }
      section_ = Section::Service;
      return;
    }
    if (text.rfind("[user ", 0) != 0 || text.back() != ']') {
      throw std::invalid_argument("a section is [service] or [user NAME@DOMAIN]");
    }
    user_ = Trimmed(text.substr(kPrefixSize, text.size() - kPrefixSize - 1));
    RequireUserName(user_);
    if (!accounts_.users.emplace(user_, User()).second) {
      throw std::invalid_argument("there is a second user " + user_);
    }
    accounts_.order.push_back(user_);
    section_ = Section::User;
  }

  void TakeKey(const std::string& text) {
    const std::size_t sign = text.find('=');
    if (sign == std::string::npos) {
      throw std::invalid_argument("a line is a section, KEY = VALUE, or a comment after #");
    }
    const std::string key = Trimmed(text.substr(0, sign));
    const std::string value = Trimmed(text.substr(sign + 1));
    if (section_ == Section::None) {
      throw std::invalid_argument("there is no section before this line");
    }
    if (value.empty()) {
      throw std::invalid_argument(key + " has no value");
    }
    const bool repeats =
        section_ == Section::User && (key == "group" || key == "certificate" || key == "principal");
    if (!seen_.insert(repeats ? key + "=" + value : key).second) {
      throw std::invalid_argument(
          key + (repeats ? " is given twice with this value" : " is given twice in this section"));
    }
    const bool known =
        section_ == Section::Service ? SetServiceKey(key, value) : SetUserKey(key, value);
    if (!known) {
      throw std::invalid_argument("there is no key '" + key + "' in this section");
    }
  }

  bool SetServiceKey(const std::string& key, const std::string& value) {
    if (key == "realm") {
      accounts_.startsRealm = FlagFrom(value);
    } else if (key == "principal") {
      accounts_.servicePrincipal = ServicePrincipalFrom(value);
    } else if (key == "keytab") {
      accounts_.keytab = PathFrom(value);
    } else if (key == "user-keytabs") {
      accounts_.userKeytabs = PathFrom(value);
    } else {
      return false;
    }
    return true;
  }

  bool SetUserKey(const std::string& key, const std::string& value) {
    User& user = accounts_.users.at(user_);
    if (key == "certificate") {
      user.certificates.push_back(CertificateFrom(value));
    } else if (key == "principal") {
      if (!accounts_.principals.emplace(value, user_).second) {
        throw std::invalid_argument(value + " already belongs to another user");
      }
    } else if (key == "client-certificate") {
      SetClient(FlagFrom(value));
    } else if (key == "password") {
      accounts_.passwordLines[user_] = number_;
      return SetUserProperty(key, value, user);
    } else {
      return SetUserProperty(key, value, user);
    }
    return true;
  }

  void SetClient(bool isClient) {
    if (isClient && !accounts_.clientUser.empty()) {
      throw std::invalid_argument("the client certificate already belongs to " +
                                  accounts_.clientUser);
    }
    if (isClient) {
      accounts_.clientUser = user_;
    }
  }

  static std::string ServicePrincipalFrom(const std::string& value) {
    const std::size_t slash = value.find('/');
    if (slash == 0 || slash == std::string::npos || slash + 1 == value.size() ||
        value.find_first_of(" @\"\\") != std::string::npos || value[0] == '-') {
      throw std::invalid_argument("'" + value + "' is not of the form HTTP/HOST");
    }
    return value;
  }

  std::string PathFrom(const std::string& value) const {
    return value[0] == '/' ? value : folder_ + value;
  }

  std::string CertificateFrom(const std::string& value) const {
    try {
      return PlainPem(ReadWhole(PathFrom(value)));
    } catch (const std::runtime_error& error) {
      throw std::invalid_argument(std::string("the certificate cannot be used: ") + error.what());
    }
  }

  std::string folder_;
  AccountsFile accounts_;
  std::set<std::string> seen_;  // keys of the section, with values for those that repeat
  std::string user_;
  unsigned number_ = 0;
  Section section_ = Section::None;
  bool hasService_ = false;
};

[[noreturn]] void ThrowAt(const std::string& path, unsigned line, const std::string& message) {
  throw UsageError(path + ":" + std::to_string(line) + ": " + message);
}

// What commands of the realm's tools would misread.
bool IsPlainForRealm(const std::string& text) {
  return text[0] != '-' && text.find_first_of(" \t\"\\/") == std::string::npos;
}

}  // namespace

AccountsFile ReadAccounts(const std::string& path) {
  std::istringstream text(WithoutMark(ReadWhole(path)));
  Reader reader(path);
  unsigned number = 0;
  try {
    for (std::string line; std::getline(text, line);) {
      ++number;
      if (!line.empty() && line.back() == '\r') {
        line.pop_back();
      }
      reader.Take(line, number);
    }
    return reader.Finish();
  } catch (const std::invalid_argument& error) {
    ThrowAt(path, std::max(number, 1U), error.what());
  }
}

AccountsFile DemoAccounts() {
  AccountsFile accounts;
  accounts.users = DemoUsers();
  for (const auto& [name, user] : accounts.users) {
    accounts.order.push_back(name);
  }
  accounts.clientUser = kDemoClientUser;
  return accounts;
}

bool IsInRealm(const std::string& userName) {
  return userName.substr(userName.find('@') + 1) == KerberosRealm::kName;
}

void RequireRealmUsers(const AccountsFile& accounts, const std::string& path) {
  for (const auto& [name, line] : accounts.passwordLines) {
    if (IsInRealm(name) && (!IsPlainForRealm(accounts.users.at(name).password) ||
                            !IsPlainForRealm(name.substr(0, name.find('@'))))) {
      ThrowAt(path, line,
              "names and passwords in the realm begin with no '-' and contain no space, quote, "
              "slash or backslash");
    }
  }
}

bool SetUserProperty(const std::string& key, const std::string& value, User& user) {
  RequirePlainText(value);
  if (key == "password") {
    user.password = value;
  } else if (key == "group") {
    const std::size_t backslash = value.find('\\');
    if (backslash == 0 || backslash == std::string::npos || backslash + 1 == value.size()) {
      throw std::invalid_argument("'" + value + "' is not of the form DOMAIN\\group");
    }
    user.groups.push_back(value);
  } else if (key == "given-name") {
    user.givenName = value;
  } else if (key == "surname") {
    user.surname = value;
  } else if (key == "solution") {
    user.isSolution = FlagFrom(value);
  } else if (key == "password-expired") {
    user.passwordExpired = FlagFrom(value);
  } else {
    return false;
  }
  return true;
}

void RequireUserName(const std::string& name) {
  RequirePlainText(name);
  const std::size_t sign = name.find('@');
  if (sign == 0 || sign == std::string::npos || sign + 1 == name.size() ||
      name.find('@', sign + 1) != std::string::npos ||
      name.find_first_of(" \t") != std::string::npos) {
    throw std::invalid_argument("'" + name + "' is not of the form NAME@DOMAIN");
  }
}

}  // namespace DevSts::Program
