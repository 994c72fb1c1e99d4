// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace qz::audio {

// The evidence that a sound file was cut off, where libsndfile takes it for a shorter one: WAV,
// AIFF and AU state the size of their audio, an Ogg page states its own, MPEG audio consists of
// frames that do, and may state how many there are. Empty when there is none: an Ogg stream that
// ends with a whole page is complete, with or without the end-of-stream mark. `fd` is a regular
// file; its offset does not change.
std::string FindTruncation(int fd);

// What an Ogg stream that ends with `tail` shows: its last kOggTailBytes, or all of it if shorter.
std::string FindOggTruncation(const std::string& tail);
constexpr size_t kOggTailBytes = 27 + 255 + 255 * 255;  // the longest page

}  // namespace qz::audio
