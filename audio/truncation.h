#pragma once

#include <string>

namespace qz::audio {

// What shows that a sound file was cut off, where libsndfile takes it for a shorter one: WAV, AIFF
// and AU state the size of their audio, OGG marks its last page. Empty when nothing shows. `fd` is
// a regular file; its place in the file does not change.
std::string FindTruncation(int fd);

}  // namespace qz::audio
