// Reads a stump-based Haar cascade in OpenCV's XML format (as its data
// package ships them) and converts it, stage by stage, into the arrays that
// zeliHaarClassifierInitAlloc takes. The library itself never parses files;
// tests, benchmarks and examples use this.
//
// Conversion: OpenCV compares a feature value divided by (n x deviation),
// n = (width - 2) x (height - 2) pixels of the window's inner rectangle, with
// the node threshold; our classifiers compare the value with threshold x
// deviation, so node thresholds are multiplied by n. Its reader also lowers
// every stage threshold by 1e-5, which the conversion repeats.
#ifndef ZELCV_TESTS_HAAR_CASCADE_H
#define ZELCV_TESTS_HAAR_CASCADE_H

#include <cmath>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "zelcv.h"

namespace zeltest {

struct HaarStage {
  std::vector<ZeliRect> rects;
  std::vector<Zel32f> weights;
  std::vector<Zel32s> intWeights;  // the same weights; valid when integerWeights
  std::vector<int> counts;
  std::vector<Zel32f> thresholds, below, above;
  std::vector<Zel8u> tilted;
  Zel32f threshold = 0.0f;
  // The file's own numbers, for evaluations that follow OpenCV's arithmetic.
  std::vector<double> rawThresholds;
  double rawStageThreshold = 0.0;
  std::vector<int> featureOf;
};

struct HaarCascade {
  int width = 0, height = 0;
  bool integerWeights = true;
  bool anyTilted = false;
  std::vector<HaarStage> stages;
  // The window's inner rectangle, whose deviation normalises the features.
  ZeliRect normRect() const { return {1, 1, width - 2, height - 2}; }
  int normArea() const { return (width - 2) * (height - 2); }
};

namespace haardetail {

inline bool between(const std::string& s, const std::string& open, const std::string& close, size_t from,
                    size_t limit, std::string& out, size_t& next) {
  size_t a = s.find(open, from);
  if (a == std::string::npos || a >= limit) return false;
  a += open.size();
  size_t b = s.find(close, a);
  if (b == std::string::npos || b > limit) return false;
  out = s.substr(a, b - a);
  next = b + close.size();
  return true;
}

inline std::vector<double> numbers(const std::string& text) {
  std::vector<double> v;
  std::istringstream in(text);
  double d;
  while (in >> d) v.push_back(d);
  return v;
}

struct RawFeature {
  std::vector<std::vector<double>> rects;  // x y w h weight
  bool tilted = false;
};

}  // namespace haardetail

// Returns false (and leaves an explanation in `error`) for a file it cannot
// convert: not found, not a stump-based Haar cascade, or malformed.
inline bool loadHaarCascade(const std::string& path, HaarCascade& cascade, std::string& error) {
  using namespace haardetail;
  std::ifstream file(path);
  if (!file) {
    error = "cannot read " + path;
    return false;
  }
  std::stringstream buffer;
  buffer << file.rdbuf();
  const std::string s = buffer.str();
  std::string text;
  size_t next = 0;
  if (s.find("<featureType>HAAR</featureType>") == std::string::npos) {
    error = "not a Haar cascade";
    return false;
  }
  if (!between(s, "<height>", "</height>", 0, s.size(), text, next)) return error = "no height", false;
  cascade.height = std::atoi(text.c_str());
  if (!between(s, "<width>", "</width>", 0, s.size(), text, next)) return error = "no width", false;
  cascade.width = std::atoi(text.c_str());

  // Features first: the stages refer to them by index.
  const size_t featuresAt = s.find("<features>");
  const size_t featuresEnd = s.find("</features>");
  if (featuresAt == std::string::npos || featuresEnd == std::string::npos) return error = "no features", false;
  std::vector<RawFeature> features;
  size_t at = featuresAt;
  std::string rectsText;
  while (between(s, "<rects>", "</rects>", at, featuresEnd, rectsText, next)) {
    RawFeature f;
    size_t r = 0;
    std::string one;
    size_t after = 0;
    while (between(rectsText, "<_>", "</_>", r, rectsText.size(), one, after)) {
      f.rects.push_back(numbers(one));
      if (f.rects.back().size() != 5) return error = "malformed rectangle", false;
      r = after;
    }
    const size_t nextRects = s.find("<rects>", next);
    const size_t tiltAt = s.find("<tilted>", next);
    if (tiltAt != std::string::npos && tiltAt < std::min(nextRects, featuresEnd))
      f.tilted = std::atoi(s.c_str() + tiltAt + 8) != 0;
    features.push_back(f);
    at = next;
  }

  const size_t stagesAt = s.find("<stages>");
  const size_t stagesEnd = s.find("</stages>");
  if (stagesAt == std::string::npos || stagesEnd == std::string::npos) return error = "no stages", false;
  at = stagesAt;
  std::string countText;
  const double area = cascade.normArea();
  while (between(s, "<maxWeakCount>", "</maxWeakCount>", at, stagesEnd, countText, next)) {
    HaarStage stage;
    const int weak = std::atoi(countText.c_str());
    if (!between(s, "<stageThreshold>", "</stageThreshold>", next, stagesEnd, text, next))
      return error = "no stage threshold", false;
    stage.rawStageThreshold = std::atof(text.c_str());
    stage.threshold = float(stage.rawStageThreshold) - 1e-5f;
    for (int k = 0; k < weak; ++k) {
      std::string nodes, leaves;
      if (!between(s, "<internalNodes>", "</internalNodes>", next, stagesEnd, nodes, next) ||
          !between(s, "<leafValues>", "</leafValues>", next, stagesEnd, leaves, next))
        return error = "malformed weak classifier", false;
      const std::vector<double> n = numbers(nodes), l = numbers(leaves);
      if (n.size() != 4 || l.size() != 2) return error = "not a stump cascade", false;
      const int index = int(n[2]);
      if (index < 0 || index >= int(features.size())) return error = "feature index out of range", false;
      const RawFeature& f = features[size_t(index)];
      for (const std::vector<double>& r : f.rects) {
        stage.rects.push_back({int(r[0]), int(r[1]), int(r[2]), int(r[3])});
        stage.weights.push_back(float(r[4]));
        stage.intWeights.push_back(Zel32s(std::lround(r[4])));
        if (double(stage.intWeights.back()) != r[4]) cascade.integerWeights = false;
      }
      stage.counts.push_back(int(f.rects.size()));
      stage.rawThresholds.push_back(n[3]);
      stage.thresholds.push_back(float(n[3] * area));
      stage.below.push_back(float(l[0]));
      stage.above.push_back(float(l[1]));
      stage.tilted.push_back(f.tilted ? 1 : 0);
      stage.featureOf.push_back(index);
      cascade.anyTilted = cascade.anyTilted || f.tilted;
    }
    cascade.stages.push_back(stage);
    at = next;
  }
  if (cascade.stages.empty()) return error = "no stages", false;
  return true;
}

// The stock frontal-face cascade and the sample photograph used by the tests,
// benchmarks and examples (Debian: opencv-data, and the photograph that
// scripts/deps.sh extracts from python3-skimage).
#ifndef ZELCV_FACE_CASCADE
#define ZELCV_FACE_CASCADE "/usr/share/opencv4/haarcascades/haarcascade_frontalface_default.xml"
#endif

}  // namespace zeltest

#endif  // ZELCV_TESTS_HAAR_CASCADE_H
