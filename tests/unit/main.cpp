#include <gtest/gtest.h>

#include <clocale>

int main(int argc, char** argv)
{
    testing::InitGoogleTest(&argc, argv);
    // Conversions are the locale's; tests that need another one set it themselves.
    setlocale(LC_CTYPE, "C.UTF-8");
    return RUN_ALL_TESTS();
}
