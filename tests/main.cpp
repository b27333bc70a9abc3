// Test entry: an assertion that no test expects is a test failure, not an abort.
#include "support/TestSupport.h"

#include <gtest/gtest.h>

int main(int argc, char** argv)
{
    testing::InitGoogleTest(&argc, argv);
    ox::diag::SetAssertHandler([](const ox::wchar* expression, const ox::wchar* file, int line) {
        ADD_FAILURE() << "unexpected contract failure \"" << oxtest::Narrow(expression) << "\" at "
                      << oxtest::Narrow(file) << ":" << line;
    });
    return RUN_ALL_TESTS();
}
