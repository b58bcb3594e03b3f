// A second reference: a C++ program that prints its line through the C library only, so that
// the linker leaves out the C++ runtime and the program starts with the C library alone.
#include <cstdio>

int main() {
    std::puts("baseline");
    return 0;
}
