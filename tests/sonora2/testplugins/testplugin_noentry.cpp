// A library without the entry point.
extern "C" __attribute__((visibility("default"))) int testplugin_something() {
    return 1;
}
