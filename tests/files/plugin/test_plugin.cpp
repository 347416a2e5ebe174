// The shared object that the rvSharedLib tests load.
extern "C" __attribute__((visibility("default"))) int tessaline_plugin_answer()
{
    return 42;
}
