// What the writer produced, without the line that varies with the clock.
#ifndef TESSALINE_TESTS_CONFIG_WRITTEN_TEXT_H
#define TESSALINE_TESTS_CONFIG_WRITTEN_TEXT_H

#include <regex>
#include <string>

#include <gtest/gtest.h>

namespace tessaline::test {

// The text without its identification line, which must be the only one
// and the last line.
inline std::string body(const std::string& text)
{
    static const std::regex idLine("# Edited by Tessaline: [A-Z][a-z]+ [0-9]{2}, [0-9]{4} - [0-9:]{8}\n$");
    std::smatch match;
    EXPECT_TRUE(std::regex_search(text, match, idLine)) << text;
    const std::string rest = text.substr(0, text.size() - match.length());
    EXPECT_EQ(rest.find("Edited by"), std::string::npos) << text;
    return rest;
}

}  // namespace tessaline::test

#endif
