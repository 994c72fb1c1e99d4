// SPDX-License-Identifier: Apache-2.0
#include "tools/features/features_command.h"

#include <cctype>
#include <filesystem>
#include <set>
#include <utility>

#include "arrays/npy_file.h"
#include "base/error.h"
#include "base/interrupt.h"
#include "base/output_file.h"
#include "dataset/clip.h"
#include "dataset/clip_features.h"
#include "dataset/manifest.h"
#include "detector/framing.h"
#include "tools/console.h"

namespace qz::tools {
namespace {

namespace fs = std::filesystem;

constexpr char kList[] = "features.tsv";

struct Job {
  dataset::Recording sound;
  std::string output;  // in the folder
};

// A class as the name of a folder, whatever it is called.
std::string FolderOf(const std::string& class_name) {
  std::string folder = class_name;
  for (char& c : folder) {
    if (std::isalnum(static_cast<unsigned char>(c)) == 0 && c != '-' && c != '.') c = '_';
  }
  if (folder[0] == '.') folder[0] = '_';
  return folder;
}

class Features {
 public:
  explicit Features(const FeaturesOptions& options) : options_(options) {}

  base::ExitCode Execute();

 private:
  void ListFiles();
  void ListManifest();
  void AddJob(dataset::Recording sound, const fs::path& folder);
  // Prints a message if the file can't be read.
  void Write(const Job& job);
  void RemoveEarlierList() const;
  base::ExitCode WriteAll();
  base::ExitCode Conclude();

  const FeaturesOptions& options_;
  Console console_;
  fs::path folder_;
  std::vector<Job> jobs_;
  std::set<std::string> names_taken_;
  std::string list_ = "file\tclass\tfold\n";
  size_t written_ = 0;
  uint64_t frames_ = 0;
};

void Features::AddJob(dataset::Recording sound, const fs::path& folder) {
  const std::string stem = (folder / fs::path(sound.file).stem()).string();
  std::string name = stem;
  for (int i = 2; !names_taken_.insert(name).second; ++i) name = stem + "-" + std::to_string(i);
  jobs_.push_back({std::move(sound), name + ".npy"});
}

void Features::ListFiles() {
  const fs::path output = options_.output;
  if (options_.files.size() == 1 && output.extension() == ".npy") {
    folder_ = output.parent_path();
    jobs_.push_back({{options_.files[0], {}, 0}, output.filename().string()});
    return;
  }
  folder_ = output;
  for (const std::string& file : options_.files) AddJob({file, {}, 0}, {});
}

void Features::ListManifest() {
  folder_ = options_.output;
  for (dataset::Recording& recording : dataset::ReadManifest(options_.manifest)) {
    const std::string folder = FolderOf(recording.class_name);
    AddJob(std::move(recording), folder);
  }
}

void Features::Write(const Job& job) {
  std::vector<int16_t> samples;
  try {
    samples = dataset::ReadClip(job.sound.file);
  } catch (const base::InputError& error) {
    console_.Message("qz: skipped: " + std::string(error.what()));
    return;
  }
  if (base::Interrupted()) return;  // perhaps in the middle of a file
  const size_t frames = detector::FramesOf(samples.size());
  const fs::path path = folder_ / job.output;
  if (path.has_parent_path()) base::MakeOutputFolder(path.parent_path().string());
  base::CheckOutputFile(path.string(), {job.sound.file, options_.manifest});
  base::WriteOutputFile(path.string(), arrays::NpyBytes(arrays::MakeArray(
                                           {frames, config::kFeatureChannels},
                                           dataset::FeaturesOf(samples.data(), samples.size()))));
  list_ += job.output + '\t' + job.sound.class_name + '\t' + std::to_string(job.sound.fold) + '\n';
  frames_ += frames;
  ++written_;
}

// So that no list of an earlier run lies beside arrays of this one.
void Features::RemoveEarlierList() const {
  const std::string list = (folder_ / kList).string();
  if (!fs::exists(list)) return;
  base::CheckOutputFile(list, {options_.manifest});
  std::error_code error;
  if (!fs::is_symlink(list)) fs::remove(list, error);
  if (error) throw base::OutputError(list + ": can't be removed: " + error.message());
}

base::ExitCode Features::WriteAll() {
  if (!options_.manifest.empty()) RemoveEarlierList();
  size_t done = 0;
  for (const Job& job : jobs_) {
    Write(job);
    if (base::Interrupted()) {
      console_.Message("qz: interrupted after " + std::to_string(written_) + " of " +
                       std::to_string(jobs_.size()) + " clips");
      return base::kNotRunnable;
    }
    console_.ClipProgress(++done, jobs_.size());
  }
  if (!options_.manifest.empty() && written_ > 0) {
    base::WriteOutputFile((folder_ / kList).string(), list_);
  }
  return Conclude();
}

base::ExitCode Features::Conclude() {
  if (written_ > 0) {
    console_.Message("wrote features of " + std::to_string(frames_) + " frames in " +
                     std::to_string(written_) + (written_ == 1 ? " array" : " arrays") + " to " +
                     options_.output);
  }
  if (written_ == jobs_.size()) return base::kSuccess;
  console_.Message("qz: skipped " + std::to_string(jobs_.size() - written_) + " of " +
                   std::to_string(jobs_.size()) + " clips");
  return base::kUnreadableInput;
}

base::ExitCode Features::Execute() {
  base::CatchInterrupt();
  if (options_.manifest.empty()) {
    ListFiles();
  } else {
    ListManifest();
  }
  return WriteAll();
}

}  // namespace

base::ExitCode FeaturesCommand(const FeaturesOptions& options) {
  return Features(options).Execute();
}

}  // namespace qz::tools
