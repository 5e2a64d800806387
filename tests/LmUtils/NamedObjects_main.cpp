// The test program's entry. Weak, so that another file of this folder may bring its own.
#include <gtest/gtest.h>

__attribute__((weak)) int main(int argc, char** argv) {
  ::testing::InitGoogleTest(&argc, argv);
  return RUN_ALL_TESTS();
}
