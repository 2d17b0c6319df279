// Style and script of the page, from page.css and page.js.
#pragma once

#include <string_view>

namespace tessaly {

std::string_view pageStyle() noexcept;
std::string_view pageScript() noexcept;

}  // namespace tessaly
