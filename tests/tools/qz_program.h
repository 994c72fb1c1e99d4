// SPDX-License-Identifier: Apache-2.0
// The program qz, run from a shell.
#pragma once

#include <sys/wait.h>

#include <cstdlib>

#include "tests/support/random.h"
#include "tests/support/sound_folder.h"

namespace qz::test {

constexpr size_t kSecond = 16000;

class QzProgram : public testing::Test, protected SoundFolder {
 protected:
  // Runs a line of bash, in which $QZ is the program; its exit code. The streams are in out_ and
  // err_.
  int Run(const std::string& line) {
    const std::string script = WriteBytes("script", line);
    const int status = std::system(("QZ='" QZ_PROGRAM "' bash " + script + " >" + Path("out") +
                                    " 2>" + Path("err") + " </dev/null")
                                       .c_str());
    out_ = Contents("out");
    err_ = Contents("err");
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
  }
  // The path of a headerless file with so many samples.
  std::string Noise(size_t samples) const {
    return WriteRaw("noise.raw", Random(3).Fill<int16_t>(samples, -8000, 8000));
  }
  // The same of noise that changes its loudness, so that scores move.
  std::string LoudAndSoft(size_t samples) const {
    std::vector<int16_t> noise = Random(5).Fill<int16_t>(samples, -8000, 8000);
    for (size_t i = 0; i < samples; ++i) {
      noise[i] = static_cast<int16_t>(noise[i] >> (i / 9000 % 5 * 3 % 8));
    }
    return WriteRaw("changing.raw", noise);
  }

  std::string out_;
  std::string err_;
};

}  // namespace qz::test
