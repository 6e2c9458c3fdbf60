// What XML can carry as text, and base64 for what it cannot. Free of state.
#pragma once

#include <cstddef>
#include <optional>
#include <string>
#include <string_view>

namespace standin
{
// Where the first byte stands that is not UTF-8 or not a character that XML allows; npos if none does.
std::size_t FirstForbiddenInXml(std::string_view text);

std::string EncodeBase64(std::string_view bytes);

// Nothing if the text is not base64. White space may stand anywhere; the padding must be there.
std::optional<std::string> DecodeBase64(std::string_view text);
}  // namespace standin
