// SPDX-License-Identifier: LGPL-2.1-or-later
// Prints how many nanoseconds it takes to load the libraries named as arguments, in a process that has none
// of them.
#include <dlfcn.h>

#include <chrono>
#include <cstdio>

int main(int argc, char **argv)
{
    const auto start = std::chrono::steady_clock::now();
    for (int index = 1; index < argc; ++index) {
        if (!dlopen(argv[index], RTLD_NOW | RTLD_GLOBAL)) {
            std::fprintf(stderr, "%s\n", dlerror());
            return 1;
        }
    }
    const std::chrono::nanoseconds duration = std::chrono::steady_clock::now() - start;
    std::printf("%lld\n", static_cast<long long>(duration.count()));
    return 0;
}
