#include <gtest/gtest.h>

TEST(Placeholder31187, Builds) { SUCCEED(); }
