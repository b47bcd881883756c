// Finds the faces in a photograph with the stock frontal-face cascade and
// writes the picture with a box around each: the cascade runs one scale at a
// time on successively smaller copies of the picture, and overlapping
// detections are merged into one box when at least three agree.
//   zelcv-haar-faces <output directory> [photograph] [cascade]
// The picture is read and written with OpenCV's image files; the detection
// is the library's.
#include <cstdio>
#include <opencv2/imgcodecs.hpp>
#include <opencv2/imgproc.hpp>
#include <string>
#include <vector>

#include "support/haar_detector.h"

namespace {

struct Box {
  double x, y, size;
  int votes;
};

bool overlaps(const Box& a, const Box& b) {
  const double ix = std::max(0.0, std::min(a.x + a.size, b.x + b.size) - std::max(a.x, b.x));
  const double iy = std::max(0.0, std::min(a.y + a.size, b.y + b.size) - std::max(a.y, b.y));
  return ix * iy > 0.5 * std::min(a.size * a.size, b.size * b.size);
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 2) {
    std::fprintf(stderr, "usage: %s <output directory> [photograph] [cascade]\n", argv[0]);
    return 2;
  }
  const std::string out = argv[1];
  const std::string photoPath = argc > 2 ? argv[2] : ZELCV_TEST_DATA_DIR "/astronaut.png";
  const std::string cascadePath = argc > 3 ? argv[3] : ZELCV_FACE_CASCADE;
  cv::Mat colour = cv::imread(photoPath, cv::IMREAD_COLOR);
  if (colour.empty()) {
    std::fprintf(stderr, "cannot read %s\n", photoPath.c_str());
    return 1;
  }
  zeltest::HaarCascade cascade;
  std::string error;
  if (!zeltest::loadHaarCascade(cascadePath, cascade, error)) {
    std::fprintf(stderr, "%s: %s\n", cascadePath.c_str(), error.c_str());
    return 1;
  }
  zeltest::HaarDetector detector(cascade);
  if (!detector.ok()) return 1;
  cv::Mat gray;
  cv::cvtColor(colour, gray, cv::COLOR_BGR2GRAY);

  std::vector<Box> raw;
  for (double scale = 1.0;; scale *= 1.1) {
    const int W = int(gray.cols / scale), H = int(gray.rows / scale);
    if (W < cascade.width || H < cascade.height) break;
    cv::Mat small;
    cv::resize(gray, small, cv::Size(W, H), 0, 0, cv::INTER_LINEAR);
    std::vector<uint8_t> mask;
    if (!detector.run(small.data, int(small.step), W, H, scale > 2.0 ? 1 : 2, 10.0f, mask)) return 1;
    const ZeliSize roi = detector.windows(W, H);
    for (int y = 0; y < roi.height; ++y)
      for (int x = 0; x < roi.width; ++x)
        if (mask[size_t(y) * roi.width + x]) raw.push_back({x * scale, y * scale, cascade.width * scale, 1});
  }
  // Merge: each detection joins the first group it overlaps.
  std::vector<Box> groups;
  for (const Box& b : raw) {
    bool joined = false;
    for (Box& g : groups) {
      const Box mean{g.x / g.votes, g.y / g.votes, g.size / g.votes, 1};
      if (overlaps(mean, b)) {
        g.x += b.x, g.y += b.y, g.size += b.size, ++g.votes;
        joined = true;
        break;
      }
    }
    if (!joined) groups.push_back(b);
  }
  int faces = 0;
  for (const Box& g : groups) {
    if (g.votes < 3) continue;
    ++faces;
    const cv::Rect box(int(g.x / g.votes), int(g.y / g.votes), int(g.size / g.votes), int(g.size / g.votes));
    cv::rectangle(colour, box, cv::Scalar(0, 255, 0), 2);
    std::printf("face at (%d, %d), %d x %d (%d windows)\n", box.x, box.y, box.width, box.height, g.votes);
  }
  const std::string file = out + "/haar_faces.png";
  if (!cv::imwrite(file, colour)) {
    std::fprintf(stderr, "cannot write %s\n", file.c_str());
    return 1;
  }
  std::printf("%d face(s); wrote %s\n", faces, file.c_str());
  return faces > 0 ? 0 : 1;
}
