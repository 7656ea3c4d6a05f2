// kelvanert_core: the module's components in one static library, without the start-up.
namespace nKV_DLL300 {

// Lets a program that links the core tell which build it holds.
const char* KelvanertCoreName() { return "kelvanert_core"; }

}  // namespace nKV_DLL300
