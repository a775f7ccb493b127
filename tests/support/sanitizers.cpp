/// What the leak sanitizer leaves out. It looks this function up by its name; without the sanitizer nobody
/// calls it.
///
/// - The OpenMP runtime keeps a few blocks for each thread that has ever opened a region.
/// - `MirrorImg` leaves the processor allocated that a rebuild replaces: it is its contract.
/// - Nothing frees the blocks of `IntenPercentParams::SetCoefficients`: copies of the parameters share them.
extern "C" const char* __lsan_default_suppressions();
extern "C" const char* __lsan_default_suppressions() {
  return "leak:libomp.so\n"
         "leak:libgomp.so\n"
         "leak:filters::MirrorImg::Process\n"
         "leak:filters::details::IntenPercentParams::SetCoefficients\n";
}
