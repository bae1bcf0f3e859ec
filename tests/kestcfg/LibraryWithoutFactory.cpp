// A loadable library that lacks the plug-in's factory, for kestcfg's error path.
extern "C" __attribute__((visibility("default"))) int kestcfgTestUnrelatedFunction() {
    return 0;
}
