// What is said of a controller's presence, against a scripted platform.

#include "fleet/controllers.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <tuple>

#include "tests/fake_platform.h"

TEST(Controllers, AreOpenedOnlyByAHandle) {
  const NandExporter &row = nand_exporters[2];
  const struct {
    Script script;
    std::tuple<bool, bool, int32_t> presence;  // as the members of Presence
    const char *journal;
  } cases[] = {
      {{{"present", row.className}},
       {true, true, 0},
       "find KVRStorage = 1\nopen 1 type 0 = 2\nrelease 1\nclose 2\n"},
      {{{"present", row.className}, {"failing", "handle0"}},
       {true, false, 0},
       "find KVRStorage = 1\nopen 1 type 0 = 0\nrelease 1\n"},
      {{{"present", row.className}, {"failing", "open#1"}, {"failure", "-536870211"}},
       {true, false, -536870211},
       "find KVRStorage = 1\nopen 1 type 0 = 0\nrelease 1\n"},
      {{{"present", nand_exporters[1].className}}, {false, false, 0}, ""},
  };
  for (const auto &[script, presence, journal] : cases) {
    fleet::Presence found;
    const auto probe = [&] {
      errno = ENOMEM;  // as an earlier call may leave it
      found = fleet::Probe(row);
    };
    EXPECT_EQ(Play(script, probe), journal);
    EXPECT_EQ(std::tie(found.present, found.opened, found.result), presence);
  }
}
