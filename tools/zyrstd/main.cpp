// zyrstd: the command-line host of the library.
#include <cstdio>

#include "ZYRStd.h"

int main() {
    std::puts("zyrstd");
    return 0;
}
