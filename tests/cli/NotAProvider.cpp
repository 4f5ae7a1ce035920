// A shared library that loads but has none of the provider's factory functions.
extern "C" __attribute__((visibility("default"))) int notAProvider() { return 0; }
