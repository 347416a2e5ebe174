// A shared object for the tour to load; it knows nothing of Tessaline.
extern "C" __attribute__((visibility("default"))) const char* tour_plugin_greeting()
{
    return "hello from a plugin";
}
