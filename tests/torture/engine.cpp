#include "torture/engine.h"

#if !defined(_WIN32)
#include <setjmp.h>
#include <signal.h>
#include <unistd.h>
#endif

#include <algorithm>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <random>
#include <sstream>

#include "support/fault_injection.h"
#include "support/guard_page.h"

namespace zeltorture {

Registry& registry() {
  static Registry r;
  return r;
}

Registrar::Registrar(std::vector<Entry> (*entries)()) {
  for (Entry& e : entries()) registry().entries.push_back(std::move(e));
}

Registrar::Registrar(const char* name, Maker maker) { registry().makers.emplace_back(name, std::move(maker)); }

namespace {

const Maker* findMaker(const std::string& name) {
  for (const auto& m : registry().makers)
    if (m.first == name) return &m.second;
  return nullptr;
}

constexpr uint8_t kFill = 0xA5;
constexpr int kGuard = 64;
constexpr int kResultSentinel = 0x5A5A5A5A;

// One region of memory: guarded by sentinel bytes, or placed so that it ends
// (or begins) exactly at an inaccessible page.
class Memory {
 public:
  Memory(std::size_t bytes, Placement placement, std::size_t offset) : placement_(placement), bytes_(bytes) {
    if (bytes_ == 0) bytes_ = 1;
    if (placement == Placement::Guarded) {
      storage_.assign(bytes_ + offset + 3 * kGuard, kFill);
      uintptr_t base = reinterpret_cast<uintptr_t>(storage_.data()) + kGuard;
      base = (base + 63) & ~uintptr_t(63);
      data_ = reinterpret_cast<uint8_t*>(base) + offset;
      return;
    }
    page_ = zeltest::pageSize();
    std::size_t pages = (bytes_ + page_ - 1) / page_;
    mapped_ = (pages + 1) * page_;
    map_ = takeMapping(pages, placement);
    if (placement == Placement::PageEnd) {
      std::memset(map_, kFill, pages * page_);
      data_ = map_ + pages * page_ - bytes_;
    } else {
      std::memset(map_ + page_, kFill, pages * page_);
      data_ = map_ + page_;
    }
  }
  ~Memory() {
    if (mapping_) pool().push_back({std::move(mapping_), mapped_ / page_ - 1, placement_});
  }
  Memory(const Memory&) = delete;
  Memory& operator=(const Memory&) = delete;

  uint8_t* data() const { return data_; }
  std::size_t bytes() const { return bytes_; }

  // Mappings with their inaccessible page, kept for reuse: making one per
  // call would cost more than the calls themselves.
  struct Mapping {
    std::unique_ptr<zeltest::GuardedPages> pages;
    std::size_t count;
    Placement placement;
  };
  static std::vector<Mapping>& pool() {
    static std::vector<Mapping> mappings;
    return mappings;
  }
  uint8_t* takeMapping(std::size_t pages, Placement placement) {
    auto& p = pool();
    for (std::size_t i = 0; i < p.size(); ++i)
      if (p[i].count == pages && p[i].placement == placement) {
        mapping_ = std::move(p[i].pages);
        p.erase(p.begin() + long(i));
        return mapping_->base();
      }
    mapping_ = std::make_unique<zeltest::GuardedPages>(pages + 1);
    if (!mapping_->ok() || !mapping_->protect(placement == Placement::PageEnd ? pages : 0)) std::abort();
    return mapping_->base();
  }

  bool guardsIntact() const {
    const uint8_t* first;
    const uint8_t* last;
    if (placement_ == Placement::Guarded) {
      first = storage_.data();
      last = storage_.data() + storage_.size();
    } else if (placement_ == Placement::PageEnd) {
      first = map_;
      last = data_ + bytes_;
    } else {
      first = data_;
      last = map_ + mapped_;
    }
    for (const uint8_t* p = first; p < data_; ++p)
      if (*p != kFill) return false;
    for (const uint8_t* p = data_ + bytes_; p < last; ++p)
      if (*p != kFill) return false;
    return true;
  }

 private:
  Placement placement_;
  std::size_t bytes_;
  std::vector<uint8_t> storage_;
  std::unique_ptr<zeltest::GuardedPages> mapping_;
  uint8_t* map_ = nullptr;
  std::size_t mapped_ = 0;
  std::size_t page_ = 0;
  uint8_t* data_ = nullptr;
};

class RunArena : public Arena {
 public:
  explicit RunArena(bool odd) : odd_(odd) {}
  void* block(std::size_t bytes) override {
    blocks_.push_back(std::make_unique<Memory>(bytes, Placement::Guarded, odd_ ? 1 : 0));
    std::memset(blocks_.back()->data(), 0, bytes);
    return blocks_.back()->data();
  }
  bool odd() const override { return odd_; }
  bool guardsIntact() const {
    for (const auto& b : blocks_)
      if (!b->guardsIntact()) return false;
    return true;
  }

 private:
  bool odd_;
  std::vector<std::unique_ptr<Memory>> blocks_;
};

std::vector<double> parseNumbers(const std::string& text, char sep) {
  std::vector<double> out;
  std::stringstream ss(text);
  std::string item;
  while (std::getline(ss, item, sep)) out.push_back(std::strtod(item.c_str(), nullptr));
  return out;
}

int widthOfParams(Role r) {
  switch (r) {
    case Role::Image: return 2;
    case Role::BitImage: return 3;
    default: return 1;
  }
}

// Pixel fill that every operation takes without a special case: small
// integers, also in floating images (no NaN, no overflowing sums).
void fillPixels(uint8_t* p, std::size_t bytes, const Arg& s, std::mt19937& rng) {
  if (s.floating && s.elemSize == 4) {
    for (std::size_t i = 0; i + 4 <= bytes; i += 4) {
      float f = float(rng() % 256);
      std::memcpy(p + i, &f, 4);
    }
  } else if (s.floating && s.elemSize == 8) {
    for (std::size_t i = 0; i + 8 <= bytes; i += 8) {
      double d = double(rng() % 256);
      std::memcpy(p + i, &d, 8);
    }
  } else {
    for (std::size_t i = 0; i < bytes; ++i) p[i] = uint8_t(rng());
  }
}

#if !defined(_WIN32)
sigjmp_buf* gFaultJump = nullptr;
char gCurrentCall[256];

// A clean fault (a read of an inaccessible page) returns to the test; when
// the test does not expect one, the process says which call it died in.
void onFault(int signal) {
  if (gFaultJump) siglongjmp(*gFaultJump, 1);
  static const char prefix[] = "\ntorture: fatal fault in ";
  ssize_t ignored = write(2, prefix, sizeof prefix - 1);
  ignored = write(2, gCurrentCall, strnlen(gCurrentCall, sizeof gCurrentCall));
  ignored = write(2, "\n", 1);
  (void)ignored;
  ::signal(signal, SIG_DFL);
  raise(signal);
}

// Runs the call; with `catchFaults`, a fault inside it returns true instead
// of ending the process (the library holds no locks or resources to leak).
bool callCatching(const Entry& e, const Frame& frame, bool catchFaults, ZelStatus& status) {
  static std::vector<char> altStack(65536);
  static bool once = [] {
    stack_t st{};
    st.ss_sp = altStack.data();
    st.ss_size = altStack.size();
    sigaltstack(&st, nullptr);
    return true;
  }();
  (void)once;
  std::snprintf(gCurrentCall, sizeof gCurrentCall, "%s", e.name.c_str());
  struct sigaction action {}, oldSegv {}, oldBus {};
  action.sa_handler = onFault;
  sigemptyset(&action.sa_mask);
  action.sa_flags = SA_NODEFER | SA_ONSTACK;
  sigaction(SIGSEGV, &action, &oldSegv);
  sigaction(SIGBUS, &action, &oldBus);
  sigjmp_buf jump;
  gFaultJump = catchFaults ? &jump : nullptr;
  bool faulted = false;
  if (sigsetjmp(jump, 1) == 0) status = e.call(frame);
  else faulted = true;
  gFaultJump = nullptr;
  sigaction(SIGSEGV, &oldSegv, nullptr);
  sigaction(SIGBUS, &oldBus, nullptr);
  return faulted;
}
#else
// No recovery from a fault here: it ends the test process.
bool callCatching(const Entry& e, const Frame& frame, bool, ZelStatus& status) {
  status = e.call(frame);
  return false;
}
#endif

}  // namespace

bool Arg::pointer() const {
  switch (role) {
    case Role::Image: case Role::BitImage: case Role::Rows: case Role::Array: case Role::Result:
    case Role::Buffer: case Role::Block: case Role::State: case Role::New: case Role::Object:
      return true;
    default:
      return false;
  }
}

int64_t Arg::checkedRowBytes(int64_t width) const {
  if (role == Role::BitImage) return (width + extraCols + 7) / 8;
  return (scaled(width) + extraCols) * channels * elemSize;
}

std::string parseRoles(const Entry& e, std::vector<Arg>& args) {
  args.clear();
  std::stringstream ss(e.roles);
  std::string token;
  int param = 0;
  auto fail = [&](const std::string& why) { return "'" + token + "': " + why; };
  while (ss >> token) {
    Arg s;
    s.param = param;
    std::string head = token, mods;
    std::size_t colon = token.find(':');
    if (colon != std::string::npos) {
      head = token.substr(0, colon);
      mods = token.substr(colon);
    }
    std::string arg;
    std::size_t eq = head.find('=');
    if (eq != std::string::npos) {
      arg = head.substr(eq + 1);
      head = head.substr(0, eq);
    }
    if (!head.empty() && head.back() == '?') {
      s.nullable = false;
      head.pop_back();
    }
    auto channelsOf = [&](const std::string& prefix) {
      std::string rest = head.substr(prefix.size());
      std::size_t plus = rest.find('+');
      if (plus != std::string::npos) {
        s.rowsExtra = std::atoi(rest.c_str() + plus + 1);
        rest = rest.substr(0, plus);
      }
      return rest.empty() ? 1 : std::atoi(rest.c_str());
    };
    if (head == "mask") {
      s.role = Role::Image;
      s.dir = 'm';
    } else if (head.rfind("rin", 0) == 0 || head.rfind("rout", 0) == 0) {
      s.role = Role::Rows;
      s.dir = head[1] == 'i' ? 'i' : 'o';
      s.channels = channelsOf(s.dir == 'i' ? "rin" : "rout");
    } else if (head.rfind("in", 0) == 0 || head.rfind("out", 0) == 0 || head.rfind("io", 0) == 0) {
      s.role = Role::Image;
      std::string prefix = head.rfind("in", 0) == 0 ? "in" : head.rfind("io", 0) == 0 ? "io" : "out";
      s.dir = prefix == "in" ? 'i' : prefix == "io" ? 'b' : 'o';
      s.channels = channelsOf(prefix);
    } else if (head == "bin" || head == "bout") {
      s.role = Role::BitImage;
      s.dir = head == "bin" ? 'i' : 'o';
    } else if (head == "roi") {
      s.role = Role::Roi;
    } else if (head == "roiw") {
      s.role = Role::RoiWidth;
    } else if (head == "sz") {
      s.role = Role::Size;
      std::vector<double> n = parseNumbers(arg, 'x');
      if (n.size() != 2) return fail("sz=WxH");
      s.size = {int(n[0]), int(n[1])};
    } else if (head == "pt") {
      s.role = Role::Point;
      std::vector<double> n = parseNumbers(arg, ',');
      if (n.size() != 2) return fail("pt=X,Y");
      s.point = {int(n[0]), int(n[1])};
    } else if (head == "rect") {
      s.role = Role::Rect;
      std::vector<double> n = parseNumbers(arg, ',');
      if (n.size() != 4) return fail("rect=X,Y,W,H");
      s.rect = {int(n[0]), int(n[1]), int(n[2]), int(n[3])};
    } else if (head.empty() && !arg.empty()) {
      s.role = Role::Scalar;
      s.values = {std::strtod(arg.c_str(), nullptr)};
    } else if (head == "border") {
      s.role = Role::Border;
      s.values = parseNumbers(arg, ',');
      if (s.values.empty()) return fail("border=kind[,kind...]");
    } else if (head == "arr") {
      s.role = Role::Array;
      std::vector<double> n = parseNumbers(arg, ',');
      if (n.empty()) return fail("arr=count[,value...]");
      s.count = int(n[0]);
      // Element k takes the k-th value given, the last one when there are fewer.
      s.values = n.size() > 1 ? std::vector<double>(n.begin() + 1, n.end()) : std::vector<double>{0.0};
    } else if (head == "res") {
      s.role = Role::Result;
    } else if (head == "buf" || head == "blk") {
      s.role = head == "buf" ? Role::Buffer : Role::Block;
      s.bytes = arg.empty() ? 64 * 1024 : std::size_t(std::atol(arg.c_str()));
    } else if (head == "state" || head == "new" || head == "obj") {
      s.role = head == "state" ? Role::State : head == "new" ? Role::New : Role::Object;
      s.maker = arg;
      if (!findMaker(arg)) return fail("no maker named '" + arg + "'");
    } else if (head == "null") {
      s.role = Role::Null;
      s.nullable = false;
    } else {
      return fail("unknown role");
    }
    // Modifiers.
    std::stringstream ms(mods);
    std::string m;
    while (std::getline(ms, m, ':')) {
      if (m.empty()) continue;
      if (m.rfind("w+", 0) == 0) s.extraCols = std::atoi(m.c_str() + 2);
      else if (m.rfind("h+", 0) == 0) s.extraRows = std::atoi(m.c_str() + 2);
      else if (m.rfind("r+", 0) == 0) s.readCols = std::atoi(m.c_str() + 2);
      else if (m == "x2") s.scale = 2;
      else if (m == "d2") s.scale = -2;
      else if (m == "na") s.alignChecked = false;
      else if (m == "@s" || m == "@t") s.rank = m[1];
      else if (m == "W") s.boundW = true;
      else if (m == "H") s.boundH = true;
      else if (m == "L") s.boundH = s.boundHuge = true;
      else return fail("unknown modifier '" + m + "'");
    }
    // Against the C parameters.
    int n = widthOfParams(s.role);
    if (param + n > int(e.params.size())) return fail("more roles than parameters");
    const ParamInfo& first = e.params[size_t(param)];
    char want = 'p';
    switch (s.role) {
      case Role::Roi: case Role::Size: want = 'S'; break;
      case Role::Point: want = 'P'; break;
      case Role::Rect: want = 'R'; break;
      case Role::RoiWidth: case Role::Border: want = 'i'; break;
      case Role::Scalar: want = first.kind == 'f' ? 'f' : 'i'; break;
      default: break;
    }
    if (first.kind != want) return fail(std::string("parameter ") + std::to_string(param) + " is not of kind " + want);
    if (s.role == Role::Image || s.role == Role::Rows || s.role == Role::Array) {
      s.elemSize = first.elemSize;
      s.floating = first.floating;
      if (s.elemSize == 0) return fail("needs a pointer to pixels");
      if (s.role == Role::Rows && first.depth != 2) return fail("rows need a pointer to row pointers");
    }
    if (s.role == Role::New && first.depth != 2) return fail("new= takes a pointer to the object pointer");
    if (s.role == Role::Result && (first.elemSize != 4 || first.floating || first.depth != 1))
      return fail("res takes an int*; use blk for other results");
    for (int k = 1; k < n; ++k)
      if (e.params[size_t(param + k)].kind != 'i') return fail("step and bit offset must be integers");
    param += n;
    args.push_back(s);
  }
  if (param != int(e.params.size()))
    return "roles cover " + std::to_string(param) + " of " + std::to_string(e.params.size()) + " parameters";
  return "";
}

const std::vector<Described>& described() {
  static const std::vector<Described> all = [] {
    std::vector<Described> out;
    for (const Entry& e : registry().entries) {
      Described d{&e, {}};
      std::string error = parseRoles(e, d.args);
      if (!error.empty()) {
        std::fprintf(stderr, "torture table: %s: %s\n", e.name.c_str(), error.c_str());
        std::abort();
      }
      out.push_back(std::move(d));
    }
    std::sort(out.begin(), out.end(), [](const Described& a, const Described& b) { return a.entry->name < b.entry->name; });
    return out;
  }();
  return all;
}

namespace {

// A table value as an integer argument. Values meant for float parameters
// (1e30, NaN) have no integer form: they saturate, and NaN gives 0, rather
// than make the conversion itself undefined.
long long integerOf(double v) {
  if (!(v == v)) return 0;
  if (v >= 9.2e18) return LLONG_MAX;
  if (v <= -9.2e18) return LLONG_MIN;
  return static_cast<long long>(v);
}

struct ImageMemory {
  std::unique_ptr<Memory> memory;
  int step = 0;
  int rows = 0;
  std::size_t extent = 0;  // bytes of one row that are read or written
  std::vector<void*> rowPointers;
};

}  // namespace

Outcome run(const Entry& e, const std::vector<Arg>& args, const Variant& v, int failAllocationsFrom) {
  Outcome out;
  std::unique_ptr<zeltest::FaultInjection> injection;
  if (v.countAllocations) injection = std::make_unique<zeltest::FaultInjection>();
  RunArena arena(v.odd);
  std::mt19937 rng(12345);
  const int w = v.roi.width, h = v.roi.height;
  Frame frame(e.params.size());
  std::vector<ImageMemory> images(args.size());
  std::vector<std::unique_ptr<Memory>> blocks(args.size());
  std::vector<int> results(args.size(), kResultSentinel);
  std::vector<void*> newSlots(args.size(), nullptr);
  static int newSentinel;
  std::vector<void*> objects(args.size(), nullptr);
  std::vector<void*> states(args.size(), nullptr);  // states the library allocated

  for (std::size_t i = 0; i < args.size(); ++i) {
    const Arg& s = args[i];
    Value& val = frame[size_t(s.param)];
    Placement placement = int(i) == v.pageArg ? (v.pageBegin ? Placement::PageBegin : Placement::PageEnd)
                                               : Placement::Guarded;
    switch (s.role) {
      case Role::Image:
      case Role::BitImage: {
        ImageMemory& im = images[i];
        const int cols = int(s.scaled(w)) + s.extraCols + s.readCols;
        const int bitOffset = 0;
        im.rows = int(s.scaled(h)) + s.extraRows;
        im.extent = s.role == Role::BitImage ? std::size_t(bitOffset + cols + 7) / 8
                                             : std::size_t(cols) * size_t(s.channels) * size_t(s.elemSize);
        int step = int(std::max<int64_t>(std::max<int64_t>(s.checkedRowBytes(w), int64_t(im.extent)), 1));
        if (s.role == Role::BitImage) step = int(std::max<std::size_t>(size_t(step), (size_t(bitOffset) + size_t(w) + 7) / 8));
        if (v.odd) step += (s.elemSize == 1 || !s.alignChecked) ? 1 : s.elemSize;
        im.step = step;
        std::size_t bytes = std::size_t(step) * size_t(im.rows - 1) + im.extent;
        std::size_t offset = (v.odd && s.elemSize == 1) ? 1 : 0;
        im.memory = std::make_unique<Memory>(bytes, placement, offset);
        if (s.dir != 'o')
          for (int r = 0; r < im.rows; ++r) fillPixels(im.memory->data() + size_t(step) * size_t(r), im.extent, s, rng);
        val.p = im.memory->data();
        frame[size_t(s.param + 1)].i = step;
        if (s.role == Role::BitImage) frame[size_t(s.param + 2)].i = bitOffset;
        break;
      }
      case Role::Rows: {
        ImageMemory& im = images[i];
        im.rows = h + s.rowsExtra;
        im.extent = std::size_t(w) * size_t(s.channels) * size_t(s.elemSize);
        im.step = int(im.extent);
        im.memory = std::make_unique<Memory>(im.extent * size_t(im.rows), placement, 0);
        if (s.dir == 'i') fillPixels(im.memory->data(), im.extent * size_t(im.rows), s, rng);
        for (int r = 0; r < im.rows; ++r) im.rowPointers.push_back(im.memory->data() + im.extent * size_t(r));
        val.p = im.rowPointers.data();
        break;
      }
      case Role::Roi: val.size = {int(s.scaled(v.roi.width)), int(s.scaled(v.roi.height))}; break;
      case Role::RoiWidth: val.i = w; break;
      case Role::Size: val.size = s.size; break;
      case Role::Point: val.point = s.point; break;
      case Role::Rect: val.rect = s.rect; break;
      case Role::Scalar: val.i = integerOf(s.values[0]); val.f = s.values[0]; break;
      case Role::Border: val.i = integerOf(s.values[std::min<std::size_t>(size_t(v.border), s.values.size() - 1)]); break;
      case Role::Array: {
        blocks[i] = std::make_unique<Memory>(size_t(s.count) * size_t(s.elemSize), Placement::Guarded, 0);
        uint8_t* p = blocks[i]->data();
        for (int k = 0; k < s.count; ++k) {
          const double value = s.values[std::min<std::size_t>(size_t(k), s.values.size() - 1)];
          if (s.floating && s.elemSize == 4) { float f = float(value); std::memcpy(p + k * 4, &f, 4); }
          else if (s.floating) { double d = value; std::memcpy(p + k * 8, &d, 8); }
          else { long long x = integerOf(value); std::memcpy(p + k * s.elemSize, &x, size_t(s.elemSize)); }
        }
        val.p = p;
        break;
      }
      case Role::Result: val.p = &results[i]; break;
      case Role::Buffer:
      case Role::Block:
        blocks[i] = std::make_unique<Memory>(s.bytes, Placement::Guarded, v.odd ? 1 : 0);
        if (s.role == Role::Block) std::memset(blocks[i]->data(), 0, s.bytes);
        val.p = blocks[i]->data();
        break;
      case Role::State:
        val.p = findMaker(s.maker)->make(arena, v.roi);
        if (!val.p) out.setupError = "maker " + s.maker + " failed";
        if (findMaker(s.maker)->release) states[i] = val.p;
        break;
      case Role::New:
        newSlots[i] = &newSentinel;
        val.p = &newSlots[i];
        break;
      case Role::Object:
        objects[i] = findMaker(s.maker)->make(arena, v.roi);
        if (!objects[i]) out.setupError = "maker " + s.maker + " failed";
        val.p = objects[i];
        break;
      case Role::Null: val.p = nullptr; break;
    }
  }
  if (!out.setupError.empty()) {
    for (std::size_t i = 0; i < args.size(); ++i) {
      if (objects[i]) findMaker(args[i].maker)->release(objects[i]);
      if (states[i]) findMaker(args[i].maker)->release(states[i]);
    }
    return out;
  }

  std::vector<std::vector<void*>> rowCopies;
  for (const Mutation& m : v.mutations) {
    const Arg* s = m.arg >= 0 ? &args[size_t(m.arg)] : nullptr;
    switch (m.kind) {
      case Mutation::Null: frame[size_t(s->param)].p = nullptr; break;
      case Mutation::RowEntryNull: {
        rowCopies.push_back(images[size_t(m.arg)].rowPointers);
        rowCopies.back().back() = nullptr;
        frame[size_t(s->param)].p = rowCopies.back().data();
        break;
      }
      case Mutation::Width:
      case Mutation::Height:
        for (const Arg& r : args)
          if (r.role == Role::Roi) {
            if (m.kind == Mutation::Width) frame[size_t(r.param)].size.width = int(m.value);
            else frame[size_t(r.param)].size.height = int(m.value);
          }
        break;
      case Mutation::RoiWidth:
        for (const Arg& r : args)
          if (r.role == Role::RoiWidth) frame[size_t(r.param)].i = m.value;
        break;
      case Mutation::Step: frame[size_t(s->param + 1)].i = m.value; break;
      case Mutation::BitOffset: frame[size_t(s->param + 2)].i = m.value; break;
    }
  }

  // What the call may not change when it fails.
  auto snapshot = [&](bool withBlocks) {
    std::vector<std::vector<uint8_t>> snap;
    for (std::size_t i = 0; i < args.size(); ++i) {
      if (images[i].memory) {
        const ImageMemory& im = images[i];
        std::size_t bytes = args[i].role == Role::Rows ? im.extent * size_t(im.rows)
                                                        : size_t(im.step) * size_t(im.rows - 1) + im.extent;
        snap.emplace_back(im.memory->data(), im.memory->data() + bytes);
      }
      if (args[i].role == Role::Block && withBlocks)
        snap.emplace_back(blocks[i]->data(), blocks[i]->data() + args[i].bytes);
    }
    snap.emplace_back(reinterpret_cast<uint8_t*>(results.data()),
                      reinterpret_cast<uint8_t*>(results.data() + results.size()));
    return snap;
  };
  std::vector<std::vector<uint8_t>> before = snapshot(true), beforeImages = snapshot(false);
  const int allocationsBefore = injection ? injection->allocations() : 0;
  if (injection && failAllocationsFrom >= 0) injection->failAllocationsFrom(allocationsBefore + failAllocationsFrom);
  if (v.countAllocations) {
    out.faulted = callCatching(e, frame, v.catchFaults, out.status);
    if (out.faulted) out.status = kFaulted;
  } else {
    out.status = e.call(frame);
  }
  if (injection) {
    injection->failAllocationsFrom(-1);
    out.allocations = injection->allocations() - allocationsBefore;
  }
  out.untouched = snapshot(true) == before;
  out.imagesUntouched = snapshot(false) == beforeImages;

  for (std::size_t i = 0; i < args.size(); ++i) {
    const Arg& s = args[i];
    if (s.role == Role::New) {
      if (newSlots[i] != &newSentinel) {
        if (out.status == zelStatusOk && newSlots[i]) findMaker(s.maker)->release(newSlots[i]);
        else out.untouched = out.imagesUntouched = false;
      }
    }
    if (s.role == Role::Object && out.status != zelStatusOk) findMaker(s.maker)->release(objects[i]);
    // A state the library allocated (its maker can release it) goes back now.
    if (states[i]) findMaker(s.maker)->release(states[i]);
    if (s.role == Role::Result) out.results.push_back(results[i]);
    if (images[i].memory && !images[i].memory->guardsIntact()) out.guardsIntact = false;
    if (blocks[i] && !blocks[i]->guardsIntact()) out.guardsIntact = false;
    // The pixels a successful call produced, row by row.
    if (images[i].memory && s.writesPixels()) {
      const ImageMemory& im = images[i];
      for (int r = 0; r < im.rows; ++r) {
        const uint8_t* row = im.memory->data() + size_t(im.step) * size_t(r);
        out.outputs.emplace_back(row, row + im.extent);
      }
    }
  }
  if (!arena.guardsIntact()) out.guardsIntact = false;
  out.liveBlocks = injection ? injection->liveBlocks() : 0;
  return out;
}

}  // namespace zeltorture
