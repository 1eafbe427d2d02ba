// Case mapping, normalisation forms and UTF-32: a seam to ICU. No locale, of the process or any
// other, takes part.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace xquery {

enum class NSNormalizationForm : uint8_t { C, D, KC, KD };

// The full mappings of the text as a whole: one character may become several, and a final sigma is
// one. Lone surrogates stay as they are, here and when normalising.
std::u16string upperCasedText(std::u16string_view text);
std::u16string lowerCasedText(std::u16string_view text);

std::u16string normalizedText(std::u16string_view text, NSNormalizationForm form);

// Nothing when one is above U+10FFFF, negative or a surrogate.
std::optional<std::u16string> textWithCodePoints(const std::vector<int32_t>& points);
// Nothing when the text has a lone surrogate.
std::optional<std::vector<int32_t>> codePointsOfText(std::u16string_view text);

}  // namespace xquery
