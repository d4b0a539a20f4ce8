#include <gmock/gmock.h>

#include "support/AbortOnAssertion.h"

int main(int argc, char** argv) {
    ::testing::InitGoogleMock(&argc, argv);
    TestSupport::abortOnAssertion();
    return RUN_ALL_TESTS();
}
