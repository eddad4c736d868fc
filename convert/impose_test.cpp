#include <gtest/gtest.h>

TEST(Placeholder5662, Builds) { SUCCEED(); }
