#include "figures.h"

#include <algorithm>
#include <stdexcept>

#include "ranking.h"

namespace qz::evaluation {
namespace {

void Add(const Merit& merit, double weight, Merit* sum) {
  sum->average_precision += weight * merit.average_precision;
  sum->roc_auc += weight * merit.roc_auc;
  sum->recall += weight * merit.recall;
}

ClassFigures FiguresOfClass(const std::vector<ScoredClip>& clips, int output, size_t allowed) {
  std::vector<float> scores;
  std::vector<bool> positives;
  for (const ScoredClip& clip : clips) {
    scores.push_back(clip.highest[static_cast<size_t>(output)]);
    positives.push_back(clip.output == output);
  }
  ClassFigures figures;
  figures.clips = static_cast<size_t>(std::count(positives.begin(), positives.end(), true));
  // Each has a value, since no class is empty.
  figures.merit = {AveragePrecision(scores, positives).value(), RocAuc(scores, positives).value(),
                   RecallAtFalseAlarms(scores, positives, allowed).value()};
  return figures;
}

}  // namespace

std::vector<int> EmptyClasses(const std::vector<ScoredClip>& clips) {
  std::vector<int> empty;
  for (int output = 0; output < model::kClasses; ++output) {
    const bool heard = std::any_of(clips.begin(), clips.end(), [output](const ScoredClip& clip) {
      return clip.output == output;
    });
    if (!heard) empty.push_back(output);
  }
  return empty;
}

Figures FiguresOf(const std::vector<ScoredClip>& clips) {
  const std::vector<int> empty = EmptyClasses(clips);
  if (!empty.empty()) {
    throw std::invalid_argument("output " + std::to_string(empty[0]) +
                                " has no clip of its class, should have one or more");
  }
  Figures figures;
  figures.clips = clips.size();
  for (const ScoredClip& clip : clips) figures.samples += clip.samples;
  figures.allowed_false_alarms = figures.samples / kSamplesPerFalseAlarm;
  for (int output = 0; output < model::kClasses; ++output) {
    ClassFigures& of_class = figures.classes[static_cast<size_t>(output)];
    of_class = FiguresOfClass(clips, output, figures.allowed_false_alarms);
    Add(of_class.merit, 1.0 / model::kClasses, &figures.mean);
  }
  return figures;
}

Figures MeanOverFolds(const std::vector<Figures>& folds) {
  const double weight = 1.0 / static_cast<double>(folds.size());
  Figures mean;
  for (const Figures& fold : folds) {
    mean.clips += fold.clips;
    mean.samples += fold.samples;
    mean.allowed_false_alarms += fold.allowed_false_alarms;
    for (size_t i = 0; i < mean.classes.size(); ++i) {
      mean.classes[i].clips += fold.classes[i].clips;
      Add(fold.classes[i].merit, weight, &mean.classes[i].merit);
    }
    Add(fold.mean, weight, &mean.mean);
  }
  return mean;
}

Confusion ConfusionOf(const std::vector<ScoredClip>& clips) {
  Confusion confusion;
  for (const ScoredClip& clip : clips) {
    const auto highest = std::max_element(clip.highest.begin(), clip.highest.end());
    const auto output = static_cast<size_t>(highest - clip.highest.begin());
    if (clip.output >= 0) {
      ++confusion.classes[static_cast<size_t>(clip.output)][output];
    } else {
      auto& raised = confusion.negatives[clip.class_name];
      ++raised[*highest > kRaised ? output : raised.size() - 1];
    }
  }
  return confusion;
}

}  // namespace qz::evaluation
