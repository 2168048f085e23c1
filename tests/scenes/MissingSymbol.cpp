// A plug-in library with a factory that needs a function no library defines:
// opening it with immediate binding fails.
extern "C" int absentFromEveryLibrary();

extern "C" __attribute__((visibility("default"))) void* createScene(int*, void*, void*) {
    return reinterpret_cast<void*>(absentFromEveryLibrary());
}
