#include <gtest/gtest.h>

#include "LQ_Utils.h"
#include "LogCapture.h"

TEST(Checks, placeholder) { EXPECT_EQ(LQ::fromStr<int>("12"), 12); }
