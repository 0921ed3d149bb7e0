// SPDX-License-Identifier: MIT
// Messages on standard error. File names and arguments in them may hold anything.
#pragma once

#include <streambuf>
#include <string>
#include <string_view>

namespace netfloor::cli {

// The text with everything that controls a terminal, except line ends, and all that is no UTF-8 as \x1b.
[[nodiscard]] std::string withoutControls(std::string_view text);

// As long as it lives, std::cerr writes withoutControls.
class PrintableErrors final : public std::streambuf {
public:
    PrintableErrors();
    ~PrintableErrors() override;
    PrintableErrors(const PrintableErrors &) = delete;
    PrintableErrors &operator=(const PrintableErrors &) = delete;

protected:
    int_type overflow(int_type character) override;
    std::streamsize xsputn(const char *text, std::streamsize octets) override;
    int sync() override;

private:
    std::streambuf *target_;
};

} // namespace netfloor::cli
