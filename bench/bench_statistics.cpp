// Masked statistics against cv::norm, cv::mean, cv::meanStdDev and
// cv::minMaxLoc on 8u and 32f 1920x1080 images, plain and with a mask that
// selects about half of the pixels; and 500 sub-pixel 21x21 windows against
// cv::getRectSubPix. The images are natural-looking pictures (32f: the same
// converted), so the extrema are not found in the first row.
#include <opencv2/imgproc.hpp>

#include "harness.h"

namespace {

struct Images {
  cv::Mat a, b, mask;
};

std::shared_ptr<Images> images(int depth) {
  auto im = std::make_shared<Images>();
  cv::Mat a = zelbench::naturalImage(1920, 1080, 5), b = zelbench::naturalImage(1920, 1080, 6);
  im->mask = zelbench::randomMat(1920, 1080, CV_8UC1, 9) > 127;
  a.convertTo(im->a, depth);
  b.convertTo(im->b, depth);
  return im;
}

const char* kNormNames[3] = {"inf", "l1", "l2"};
const int kCvNorms[3] = {cv::NORM_INF, cv::NORM_L1, cv::NORM_L2};

template <typename T>
struct Calls;

#define ZELBENCH_CALLS(T, tn)                                                                                  \
  template <>                                                                                                  \
  struct Calls<T> {                                                                                            \
    static ZelStatus norm(int k, const Images& im, bool masked, Zel64f* v) {                                   \
      using N = ZelStatus(ZELCV_CALL*)(const T*, int, ZeliSize, Zel64f*);                                               \
      using NM = ZelStatus(ZELCV_CALL*)(const T*, int, const Zel8u*, int, ZeliSize, Zel64f*);                           \
      static const N n[3] = {zeliNorm_Inf_##tn##_C1R, zeliNorm_L1_##tn##_C1R, zeliNorm_L2_##tn##_C1R};        \
      static const NM nm[3] = {zeliNorm_Inf_##tn##_C1MR, zeliNorm_L1_##tn##_C1MR, zeliNorm_L2_##tn##_C1MR};   \
      return masked ? nm[k](im.a.ptr<T>(), int(im.a.step), im.mask.data, int(im.mask.step), roi(im), v)       \
                    : n[k](im.a.ptr<T>(), int(im.a.step), roi(im), v);                                          \
    }                                                                                                          \
    static ZelStatus diff(int k, const Images& im, bool masked, Zel64f* v) {                                   \
      using D = ZelStatus(ZELCV_CALL*)(const T*, int, const T*, int, ZeliSize, Zel64f*);                                \
      using DM = ZelStatus(ZELCV_CALL*)(const T*, int, const T*, int, const Zel8u*, int, ZeliSize, Zel64f*);            \
      static const D d[3] = {zeliNormDiff_Inf_##tn##_C1R, zeliNormDiff_L1_##tn##_C1R,                          \
                             zeliNormDiff_L2_##tn##_C1R};                                                      \
      static const DM dm[3] = {zeliNormDiff_Inf_##tn##_C1MR, zeliNormDiff_L1_##tn##_C1MR,                      \
                               zeliNormDiff_L2_##tn##_C1MR};                                                   \
      return masked ? dm[k](im.a.ptr<T>(), int(im.a.step), im.b.ptr<T>(), int(im.b.step), im.mask.data,       \
                            int(im.mask.step), roi(im), v)                                                     \
                    : d[k](im.a.ptr<T>(), int(im.a.step), im.b.ptr<T>(), int(im.b.step), roi(im), v);         \
    }                                                                                                          \
    static ZelStatus rel(const Images& im, bool masked, Zel64f* v) {                                           \
      return masked ? zeliNormRel_L2_##tn##_C1MR(im.a.ptr<T>(), int(im.a.step), im.b.ptr<T>(), int(im.b.step), \
                                                 im.mask.data, int(im.mask.step), roi(im), v)                  \
                    : zeliNormRel_L2_##tn##_C1R(im.a.ptr<T>(), int(im.a.step), im.b.ptr<T>(), int(im.b.step),  \
                                                roi(im), v);                                                   \
    }                                                                                                          \
    static ZelStatus mean(const Images& im, bool masked, Zel64f* v) {                                          \
      return masked ? zeliMean_##tn##_C1MR(im.a.ptr<T>(), int(im.a.step), im.mask.data, int(im.mask.step),    \
                                           roi(im), v)                                                         \
                    : zeliMean_##tn##_C1R(im.a.ptr<T>(), int(im.a.step), roi(im), v);                          \
    }                                                                                                          \
    static ZelStatus meanStdDev(const Images& im, bool masked, Zel64f* v, Zel64f* s) {                         \
      return masked ? zeliMean_StdDev_##tn##_C1MR(im.a.ptr<T>(), int(im.a.step), im.mask.data,                 \
                                                  int(im.mask.step), roi(im), v, s)                            \
                    : zeliMean_StdDev_##tn##_C1R(im.a.ptr<T>(), int(im.a.step), roi(im), v, s);                \
    }                                                                                                          \
    static ZelStatus minMax(const Images& im, bool masked, Zel64f* lo, Zel64f* hi, ZeliPoint* l, ZeliPoint* h) { \
      return masked ? zeliMinMaxIndx_##tn##_C1MR(im.a.ptr<T>(), int(im.a.step), im.mask.data,                  \
                                                 int(im.mask.step), roi(im), lo, hi, l, h)                     \
                    : zeliMinMaxIndx_##tn##_C1R(im.a.ptr<T>(), int(im.a.step), roi(im), lo, hi, l, h);         \
    }                                                                                                          \
    static ZeliSize roi(const Images& im) { return zelbench::roiOf(im.a); }                                    \
  };

ZELBENCH_CALLS(Zel8u, 8u)
ZELBENCH_CALLS(Zel32f, 32f)

template <typename T>
void registerType(int depth, const std::string& type) {
  auto im = images(depth);
  for (bool masked : {false, true}) {
    const std::string suffix = type + (masked ? "_masked" : "") + "/1920x1080";
    const cv::Mat noMask;
    for (int k = 0; k < 3; ++k) {
      zelbench::registerPair(
          "statistics", std::string("norm_") + kNormNames[k] + "_" + suffix,
          [=](benchmark::State& state) {
            Zel64f v;
            for (auto _ : state) {
              benchmark::DoNotOptimize(Calls<T>::norm(k, *im, masked, &v));
              benchmark::DoNotOptimize(v);
            }
          },
          [=](benchmark::State& state) {
            for (auto _ : state) benchmark::DoNotOptimize(cv::norm(im->a, kCvNorms[k], masked ? im->mask : noMask));
          });
      zelbench::registerPair(
          "statistics", std::string("normdiff_") + kNormNames[k] + "_" + suffix,
          [=](benchmark::State& state) {
            Zel64f v;
            for (auto _ : state) {
              benchmark::DoNotOptimize(Calls<T>::diff(k, *im, masked, &v));
              benchmark::DoNotOptimize(v);
            }
          },
          [=](benchmark::State& state) {
            for (auto _ : state)
              benchmark::DoNotOptimize(cv::norm(im->a, im->b, kCvNorms[k], masked ? im->mask : noMask));
          });
    }
    zelbench::registerPair(
        "statistics", "normrel_l2_" + suffix,
        [=](benchmark::State& state) {
          Zel64f v;
          for (auto _ : state) {
            benchmark::DoNotOptimize(Calls<T>::rel(*im, masked, &v));
            benchmark::DoNotOptimize(v);
          }
        },
        [=](benchmark::State& state) {
          for (auto _ : state)
            benchmark::DoNotOptimize(
                cv::norm(im->a, im->b, cv::NORM_L2 | cv::NORM_RELATIVE, masked ? im->mask : noMask));
        });
    zelbench::registerPair(
        "statistics", "mean_" + suffix,
        [=](benchmark::State& state) {
          Zel64f v;
          for (auto _ : state) {
            benchmark::DoNotOptimize(Calls<T>::mean(*im, masked, &v));
            benchmark::DoNotOptimize(v);
          }
        },
        [=](benchmark::State& state) {
          for (auto _ : state) benchmark::DoNotOptimize(cv::mean(im->a, masked ? im->mask : noMask));
        });
    zelbench::registerPair(
        "statistics", "meanstddev_" + suffix,
        [=](benchmark::State& state) {
          Zel64f v, s;
          for (auto _ : state) {
            benchmark::DoNotOptimize(Calls<T>::meanStdDev(*im, masked, &v, &s));
            benchmark::DoNotOptimize(s);
          }
        },
        [=](benchmark::State& state) {
          cv::Scalar m, s;
          for (auto _ : state) {
            cv::meanStdDev(im->a, m, s, masked ? im->mask : noMask);
            benchmark::DoNotOptimize(s);
          }
        });
    zelbench::registerPair(
        "statistics", "minmaxindx_" + suffix,
        [=](benchmark::State& state) {
          Zel64f lo, hi;
          ZeliPoint l, h;
          for (auto _ : state) {
            benchmark::DoNotOptimize(Calls<T>::minMax(*im, masked, &lo, &hi, &l, &h));
            benchmark::DoNotOptimize(h);
          }
        },
        [=](benchmark::State& state) {
          double lo, hi;
          cv::Point l, h;
          for (auto _ : state) {
            cv::minMaxLoc(im->a, &lo, &hi, &l, &h, masked ? im->mask : noMask);
            benchmark::DoNotOptimize(h);
          }
        });
  }
}

// 500 windows of 21x21 at scattered sub-pixel centres, as a tracker reads
// them.
void registerSubpix() {
  auto src8 = std::make_shared<cv::Mat>(zelbench::naturalImage(640, 480, 11));
  auto src32 = std::make_shared<cv::Mat>();
  src8->convertTo(*src32, CV_32F);
  auto centres = std::make_shared<std::vector<cv::Point2f>>();
  cv::RNG rng(12);
  for (int i = 0; i < 500; ++i) centres->push_back({rng.uniform(12.f, 628.f), rng.uniform(12.f, 468.f)});
  const cv::Size win(21, 21);
  for (int kind = 0; kind < 3; ++kind) {
    const char* names[3] = {"8u", "8u32f", "32f"};
    zelbench::registerPair(
        "statistics", std::string("subpix_500x21x21_") + names[kind],
        [=](benchmark::State& state) {
          cv::Mat dst(win, kind == 0 ? CV_8U : CV_32F);
          ZeliRect inside;
          for (auto _ : state) {
            for (const cv::Point2f& c : *centres) {
              const ZeliPoint_32f centre = {c.x, c.y};
              ZelStatus s;
              if (kind == 0)
                s = zeliCopySubpixIntersect_8u_C1R(src8->data, int(src8->step), {640, 480}, dst.data, int(dst.step),
                                                   {21, 21}, centre, &inside);
              else if (kind == 1)
                s = zeliCopySubpixIntersect_8u32f_C1R(src8->data, int(src8->step), {640, 480}, dst.ptr<Zel32f>(),
                                                      int(dst.step), {21, 21}, centre, &inside);
              else
                s = zeliCopySubpixIntersect_32f_C1R(src32->ptr<Zel32f>(), int(src32->step), {640, 480},
                                                    dst.ptr<Zel32f>(), int(dst.step), {21, 21}, centre, &inside);
              benchmark::DoNotOptimize(s);
            }
            benchmark::ClobberMemory();
          }
        },
        [=](benchmark::State& state) {
          cv::Mat dst(win, kind == 0 ? CV_8U : CV_32F);
          const cv::Mat& src = kind == 2 ? *src32 : *src8;
          for (auto _ : state) {
            for (const cv::Point2f& c : *centres) cv::getRectSubPix(src, win, c, dst, dst.type());
            benchmark::ClobberMemory();
          }
        });
  }
}

void registerStatistics() {
  registerType<Zel8u>(CV_8U, "8u");
  registerType<Zel32f>(CV_32F, "32f");
  registerSubpix();
}

const zelbench::Registrar registrar(registerStatistics);

}  // namespace
