#include <gtest/gtest.h>

TEST(Placeholder25153, Builds) { SUCCEED(); }
