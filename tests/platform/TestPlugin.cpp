// A tiny loadable library for the run-time loading tests.
extern "C" int kv_test_plugin_answer() { return 42; }
