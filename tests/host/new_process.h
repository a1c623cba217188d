// Runs a piece of a test in a process of its own, for what is settled once a process. Whatever
// environment the piece needs it sets first thing. What it writes to standard error goes to `matcher`.
#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>

#define EXPECT_IN_NEW_PROCESS(piece, matcher)                  \
  do {                                                         \
    GTEST_FLAG_SET(death_test_style, "threadsafe");            \
    const auto run = [&] {                                     \
      piece();                                                 \
      exit(::testing::Test::HasFailure() ? 1 : 0);             \
    };                                                         \
    EXPECT_EXIT(run(), ::testing::ExitedWithCode(0), matcher); \
  } while (false)
