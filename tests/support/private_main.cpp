// main() of test programs that run in a private host.

#include <cstring>
#include <exception>
#include <iostream>

#include <gmock/gmock.h>

#include "tests/support/private_host_setup.h"

static bool only_lists_tests(int argc, char** argv)
{
    for (int i = 1; i < argc; i++)
        if (std::strcmp(argv[i], "--gtest_list_tests") == 0) return true;
    return false;
}

int main(int argc, char** argv)
{
    try {
        if (!only_lists_tests(argc, argv)) nvrtest::enter_private_host(argv);
    } catch (const std::exception& error) {
        std::cerr << "No private host (run as root, or allow user namespaces): " << error.what() << '\n';
        return 1;
    }
    testing::InitGoogleMock(&argc, argv);
    return RUN_ALL_TESTS();
}
