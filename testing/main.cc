// The test binary's main: messages printed in-process carry vell's own name,
// so unit tests and runs of the binary compare against the same lines.
#include <errno.h>

#include <gtest/gtest.h>

int main(int argc, char** argv) {
  program_invocation_short_name = const_cast<char*>("vell");
  testing::InitGoogleTest(&argc, argv);
  return RUN_ALL_TESTS();
}
