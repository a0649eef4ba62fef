// The frame's worked member, SPACE, and what the frame caller and the hosts
// read back from a status.
#include <gtest/gtest.h>

#include <climits>
#include <cstring>
#include <string>

#include "frame/call.hpp"
#include "frame/cliudf.h"
#include "support/frame_call.hpp"

namespace {

using namespace orv::test;

// What the hosts read back from a status: one of the ten codes behind
// "38552" and "SYSFUN:", or none for anything else.
TEST(SysfunIn, ReadsOnlyTheTenCodes) {
  const struct {
    const char *sqlstate, *message;
    int code;
  } cases[] = {
      {"38552", "SYSFUN:01", 1}, {"38552", "SYSFUN:11", 11}, {"38552", "SYSFUN:10", 10},
      {"38552", "SYSFUN:09", 0}, {"38552", "SYSFUN:12", 0},  {"38552", "SYSFUN:0;", 0},
      {"38552", "SYSFUN:1", 0},  {"38553", "SYSFUN:01", 0},  {"38552", "SYSFUM:01", 0},
      {"02000", "", 0},
  };
  for (const auto &c : cases) {
    char sqlstate[CLI_SQLSTATE_SIZE] = {}, message[CLI_MESSAGE_SIZE] = {};
    std::strncpy(sqlstate, c.sqlstate, sizeof sqlstate - 1);
    std::strncpy(message, c.message, sizeof message - 1);
    EXPECT_EQ(static_cast<int>(cli::call::sysfunIn(sqlstate, message)), c.code) << c.message;
  }
}

// An export is called only with an argument count that some row has.
TEST(FrameCaller, RefusesAnArgumentCountThatNoRowHas) {
  static int calls = 0;
  void *args[cli::call::kMaxArguments] = {};
  void *fn = reinterpret_cast<void *>(+[] { ++calls; });
  for (const std::size_t count : {0U, 1U, 43U}) {
    EXPECT_FALSE(cli::call::invoke(fn, args, count)) << count;
  }
  EXPECT_EQ(calls, 0);
}

TEST(Space, GivesCountBlanksFromZeroTo4000) {
  EXPECT_EQ(call("CLI_udfSPACE", {i32(0)}, textArea()), ok(""));
  EXPECT_EQ(call("CLI_udfSPACE", {i32(3)}, textArea()), ok("   "));
  EXPECT_EQ(call("CLI_udfSPACE", {i32(4000)}, textArea()), ok(std::string(4000, ' ')));
  for (std::int32_t bad : {4001, -1, INT_MAX, INT_MIN}) {
    EXPECT_EQ(call("CLI_udfSPACE", {i32(bad)}, textArea()), fails("01")) << bad;
  }
}

}  // namespace
