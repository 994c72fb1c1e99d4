// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

namespace qz::audio {

// The evidence that a file of MPEG audio (layers I to III, behind an ID3 tag or not) was cut off: a
// last frame that is not whole, or fewer frames than its information frame ("Xing", "Info") states.
// Empty when there is none, when the frames are followed by anything else (tags, say), and for
// every other kind of file. `fd` is a regular file; its offset does not change.
std::string FindMpegTruncation(int fd);

}  // namespace qz::audio
