// The baseline of the invocation benchmark: a C++ program that prints one line the C++ way,
// so that it starts the C++ runtime as every C++ program that uses the standard library does.
#include <iostream>

int main() {
    std::cout << "baseline\n";
    return 0;
}
