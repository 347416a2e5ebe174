// The int, double, bool and rope accessors: conversions around the raw
// lookup and store.
#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include "config/lookup.h"
#include "tessaline/config/rvConfig.h"
#include "tessaline/util/rvString.h"

using tessaline::config::FindValue;
using tessaline::config::NameText;

namespace tessaline::config {
namespace {

// Room for the text of a number or a flag, terminator included.
constexpr int kNumberBufferSize = 32;

}  // namespace
}  // namespace tessaline::config

using tessaline::config::kNumberBufferSize;

int rvConfig::GetValue(const char* key, int def, const char* section)
{
    cfgStr value;
    if (FindValue(*this, NameText(key), &value, NameText(section)) == 0) {
        return def;
    }
    // Where long is 64 bits wide, clamp to what a 32-bit strtol gives.
    const long number = std::strtol(value.c_str(), nullptr, 10);
    if (number > INT_MAX) {
        return INT_MAX;
    }
    if (number < INT_MIN) {
        return INT_MIN;
    }
    return static_cast<int>(number);
}

double rvConfig::GetValue(const char* key, double def, const char* section)
{
    cfgStr value;
    if (FindValue(*this, NameText(key), &value, NameText(section)) == 0) {
        return def;
    }
    return std::strtod(value.c_str(), nullptr);
}

void rvConfig::GetValue(__gnu_cxx::crope& out, const __gnu_cxx::crope& key, const __gnu_cxx::crope& def,
                        const __gnu_cxx::crope& section)
{
    cfgStr value;
    if (FindValue(*this, NameText(cfgStr(key)), &value, NameText(cfgStr(section))) != 0) {
        out = value;
    } else {
        out = def;
    }
}

void rvConfig::GetValue(__gnu_cxx::crope& out, const char* key, const char* def, const char* section)
{
    cfgStr value;
    if (FindValue(*this, NameText(key), &value, NameText(section)) != 0) {
        out = value;
    } else {
        out = cfgStr(def);
    }
}

unsigned int rvConfig::GetBool(const char* key, unsigned int def, const char* section)
{
    cfgStr value;
    if (FindValue(*this, NameText(key), &value, NameText(section)) == 0) {
        return def;
    }
    const char* text = value.c_str();
    if (_stricmp(text, "false") == 0 || _stricmp(text, "0") == 0) {
        return 0;
    }
    if (_stricmp(text, "true") == 0 || _stricmp(text, "1") == 0) {
        return 1;
    }
    return def;
}

unsigned int rvConfig::PutValue(const char* key, int value, const char* section)
{
    char text[kNumberBufferSize];
    std::snprintf(text, sizeof text, "%d", value);
    return _PutValue(cfgStr(key), cfgStr(text), cfgStr(section));
}

unsigned int rvConfig::PutValue(const char* key, double value, const char* section)
{
    char text[kNumberBufferSize];
    if (std::snprintf(text, sizeof text, "%f", value) >= kNumberBufferSize) {
        // At most 24 characters, and strtod gives the same double back.
        std::snprintf(text, sizeof text, "%.17g", value);
    }
    return _PutValue(cfgStr(key), cfgStr(text), cfgStr(section));
}

unsigned int rvConfig::PutValue(const __gnu_cxx::crope& key, const __gnu_cxx::crope& value,
                                const __gnu_cxx::crope& section)
{
    return _PutValue(cfgStr(key), cfgStr(value), cfgStr(section));
}

unsigned int rvConfig::PutValue(const char* key, const __gnu_cxx::crope& value, const char* section)
{
    return _PutValue(cfgStr(key), cfgStr(value), cfgStr(section));
}

unsigned int rvConfig::PutBool(const char* key, unsigned int value, const char* section)
{
    return _PutValue(cfgStr(key), cfgStr(value != 0 ? "True" : "False"), cfgStr(section));
}
