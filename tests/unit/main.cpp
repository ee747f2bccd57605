#include <gtest/gtest.h>

#include <clocale>
#include <cstdlib>

int main(int argc, char** argv)
{
    testing::InitGoogleTest(&argc, argv);
    // Conversions are the locale's; tests that need another one set it themselves. It is also the
    // one of the programs that are started, whatever the environment of this machine says.
    setenv("LC_ALL", "C.UTF-8", 1);
    setlocale(LC_CTYPE, "C.UTF-8");
    return RUN_ALL_TESTS();
}
