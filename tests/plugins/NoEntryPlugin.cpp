// A loadable library without AutoCli_RegisterNamespaces, for tests of what the framework
// does with one.
extern "C" __attribute__((visibility("default"))) int NotAnEntryPoint() {
    return 0;
}
