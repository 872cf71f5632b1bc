#include "devsts/users.h"

namespace DevSts {

Users DemoUsers() {
  return {
      {"alice@EXAMPLE.COM",
       {"secret", false, {"EXAMPLE\\staff", "EXAMPLE\\admins"}, "Alice", "Archer", false}},
      {"bob@EXAMPLE.COM", {"bob-secret", false, {}, "", "", false}},
      {"expired@EXAMPLE.COM", {"expired-secret", true, {}, "Eve", "Expired", false}},
      {"machine@EXAMPLE.COM", {"machine-secret", false, {}, "", "", true}},
  };
}

}  // namespace DevSts
