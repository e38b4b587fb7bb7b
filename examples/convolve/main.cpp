// Blurs a photograph or finds its edges with the core's intrinsics, checks every pixel against plain
// scalar code, tells how fast both are and writes the picture.
#include <kastarri.h>

#include <cstdio>
#include <string>

#include "common/options.h"
#include "common/pgm.h"
#include "common/timing.h"
#include "convolve/convolve.h"
#include "convolve/filters.h"

namespace {

using namespace examples;

// Throws if a single pixel differs from the scalar version.
void check(const Picture& got, const Picture& expected) {
  const auto differ = std::mismatch(got.pixels.begin(), got.pixels.end(), expected.pixels.begin());
  if (differ.first == got.pixels.end()) return;
  const auto at = static_cast<int>(differ.first - got.pixels.begin());
  throw std::runtime_error("pixel " + std::to_string(at % got.width) + ", " + std::to_string(at / got.width) + " is " +
                           std::to_string(*differ.first) + ", and " + std::to_string(*differ.second) +
                           " in the scalar version");
}

int convolve_picture(int argc, char** argv) {
  Options options(argc, argv, "convolves an 8-bit grey PGM with a small mask");
  const std::string input = options.path("input", EXAMPLE_DATA "/camera.pgm", "the photograph");
  const std::string output = options.path("output", "convolve.pgm", "where the picture goes");
  const std::string name = options.choice("filter", "sobel", {"sobel", "gauss"}, "edges or a blur");
  options.finish();
  const Picture photograph = read_pgm(input);
  const Filter filter = name == "gauss" ? gauss() : sobel();
  const Framed in(photograph);
  Convolved got(photograph.width, photograph.height), expected(photograph.width, photograph.height);
  const auto kernel = [&] { got.make(&convolve, in, filter); };
  const auto scalar = [&] { expected.make(&convolve_reference, in, filter); };
  kernel(), scalar();
  check(got.picture(), expected.picture());

  const Timing timing = compare(9, kernel, scalar);
  const double pixels = 1e-6 * photograph.width * photograph.height;
  std::printf("convolve: %s, %d x %d pixels, %s\n", input.c_str(), photograph.width, photograph.height, name.c_str());
  std::printf("  target    %s\n", cstub_Km_ZNB_Orbis_R5_64k_target());
  std::printf("  checked   all %zu pixels equal those of the scalar version\n", photograph.pixels.size());
  std::printf("  speed     %.1f million pixels a second, %.2f times the scalar version (%.1f)\n",
              pixels / timing.kernel, timing.ratio(), pixels / timing.scalar);
  write_pgm(output, got.picture());
  std::printf("  wrote     %s\n", output.c_str());
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run("convolve", [&] { return convolve_picture(argc, argv); });
}
