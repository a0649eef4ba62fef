// The status channel and the frame's worked member, SPACE.
#include <gtest/gtest.h>

#include <climits>
#include <cstring>
#include <string>

#include "frame/cliudf.h"
#include "support/frame_call.hpp"

namespace {

using namespace orv::test;

TEST(RaiseSysfun, StoresStateAndCodeAndNothingElse) {
  char sqlstate[8];
  char message[16];
  std::memset(sqlstate, '#', sizeof sqlstate);
  std::memset(message, '#', sizeof message);
  CLI_raiseSysfun(sqlstate, message, "10");
  EXPECT_EQ(std::string(sqlstate, 8), std::string("38552\0##", 8));
  EXPECT_EQ(std::string(message, 16), std::string("SYSFUN:10\0######", 16));
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
