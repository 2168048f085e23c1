// A plug-in library that loads but has no "createScene".
extern "C" __attribute__((visibility("default"))) int notAFactory() { return 0; }
