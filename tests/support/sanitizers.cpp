/// What the leak sanitizer leaves out: the OpenMP runtime keeps a few blocks for each thread that has ever
/// opened a region. It looks this function up by its name; without the sanitizer nobody calls it.
extern "C" const char* __lsan_default_suppressions();
extern "C" const char* __lsan_default_suppressions() { return "leak:libomp.so\nleak:libgomp.so\n"; }
