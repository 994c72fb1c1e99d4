// SPDX-License-Identifier: Apache-2.0
// What kind of sound file its first bytes are those of.
#pragma once

#include <cstddef>
#include <string>

namespace qz::audio {

// As many of the first bytes as anything here looks at.
constexpr size_t kMagicBytes = 16;

// The name of the container whose mark `head` begins with, of those that libsndfile reads and that
// a program may write to a pipe; null if it is none of them.
const char* ContainerName(const std::string& head);

// The name of a common format whose mark `head` begins with and that libsndfile does not read; null
// if it is none.
const char* UnreadableFormatName(const std::string& head);

// "MP3" (all layers) or "AAC" if `head` may be the header of a frame of theirs, null if not. It is
// little evidence: headerless samples may begin so, too.
const char* MpegName(const std::string& head);

}  // namespace qz::audio
