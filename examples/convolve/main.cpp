// Blurs a photograph or finds its edges, and checks every pixel against plain C.
#include <string>

#include "common/pgm.h"
#include "common/program.h"
#include "convolve/convolve.h"
#include "convolve/filters.h"

namespace {

using namespace examples;

void convolve_picture(Program& program) {
  const std::string name = program.options.choice("filter", "sobel", {"sobel", "gauss"}, "edges or a blur");
  program.options.finish();
  const Picture photograph = read_pgm(program.input);
  const Filter filter = name == "gauss" ? gauss() : sobel();
  const Framed in(photograph);
  Convolved got(photograph.width, photograph.height), expected(photograph.width, photograph.height);
  const auto kernel = [&] { got.make(&convolve, in, filter); };
  const auto plain = [&] { expected.make(&convolve_reference, in, filter); };
  kernel(), plain();

  program.heading(name == "gauss" ? "Gaussian blur" : "Sobel edges", describe(photograph));
  program.equal("pixels", got.picture().pixels, expected.picture().pixels);
  program.checked();
  program.speed("pixels", static_cast<double>(photograph.pixels.size()), compare(9, kernel, plain));
  write_pgm(program.output, got.picture());
  program.written();
}

}  // namespace

int main(int argc, char** argv) {
  return examples::run(
      {"convolve", "convolves an 8-bit grey PGM with a small mask", "camera.pgm", "convolve.pgm", nullptr}, argc, argv,
      convolve_picture);
}
