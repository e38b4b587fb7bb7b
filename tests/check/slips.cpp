// A kernel's slips, one a mode, each on a line that says so, and the same accesses as they should be.
#include <cstdio>
#include <map>
#include <memory>
#include <string>

#include "kastarri/names.h"

namespace {

// Objects of 96 bytes: a vector fits in, and a half of another one.
constexpr int samples = 48;
short global[samples];

std::unique_ptr<short[]> on_heap() { return std::unique_ptr<short[]>(new short[samples]()); }

template <class V>
const V* vector_at(const short* p) {
  return reinterpret_cast<const V*>(p);
}
const qv_vecNx16* vector(const short* p) { return vector_at<qv_vecNx16>(p); }

qv_vecNx16U offsets(int last) {
  unsigned short numbers[32] = {};
  numbers[31] = static_cast<unsigned short>(last);
  return ZRA_LVNX16U_I(reinterpret_cast<const qv_vecNx16U*>(numbers), 0);
}
qv_vecNx16 result;

void load() {
  const auto p = on_heap();
  result = ZRA_LVNX16_I(vector(p.get()), 64);  // slip: load
}
void before() {
  const auto p = on_heap();
  result = ZRA_LVNX16_X(vector(p.get()), -2);  // slip: before
}
void predicated() {
  const auto p = on_heap();
  result = ZRA_LVNX16T_I(vector(p.get()), 64, ZRA_LTRN(17));  // slip: predicated
}
void widening() {
  const auto p = on_heap();
  result = ZRA_LVNX8S_I(vector_at<qv_vecNx8>(p.get()), 80);  // slip: widening
}
void store() {
  const auto p = on_heap();
  ZRA_SVNX16_I(result, vector(p.get()), 64);  // slip: store
}
void predicated_store() {
  const auto p = on_heap();
  ZRA_SVNX16T_I(result, vector(p.get()), 64, ZRA_LTRN(17));  // slip: predicated_store
}
void pointer() {
  const auto p = on_heap();
  const qv_vecNx16* moving = vector(p.get());
  for (int i = 0; i < 2; ++i) ZRA_LVNX16_IP(result, &moving, 64);  // slip: pointer
}
void element() {
  const auto p = on_heap();
  ZRA_SSNX16_I(result, p.get(), 96);  // slip: element
}
void gather() {
  const auto p = on_heap();
  result = ZRA_GATHERDNX16(ZRA_GATHERANX16(p.get(), offsets(96)));  // slip: gather
}
void scatter() {
  const auto p = on_heap();
  ZRA_SCATTERNX16T(result, p.get(), offsets(96), ZRA_LTRSN(32));  // slip: scatter
}
void increment() {
  const auto p = on_heap();
  ZRA_SCATTERINCNX16(p.get(), offsets(96));  // slip: increment
}
void stack() {
  short array[samples] = {};
  const short* volatile p = array;
  result = ZRA_LVNX16_I(vector(p), 64);  // slip: stack
}
void of_globals() {
  result = ZRA_LVNX16_I(vector(global), 64);  // slip: global
}
void freed() {
  const short* p;
  {
    const auto gone = on_heap();
    p = gone.get();
  }
  result = ZRA_LVNX16_I(vector(p), 0);  // slip: freed
}
void copied() {
  const auto p = on_heap();
  result = qv_vecNx16_loadi(vector(p.get()), 64);  // slip: copied
}
void converted() {
  const auto p = on_heap();
  result = int16_mtor_qv_vecNx16(p.get(), 97);  // slip: converted
}
void operand() {
  const auto p = on_heap();
  result = ZRA_ADDNX16(vector(p.get())[0], vector(p.get())[1]);  // slip: operand
}
void words() {
  std::unique_ptr<int[]> p(new int[4]());
  RK_S32I(1, p.get(), 16);  // slip: words
}
void two() {
  load();
  store();
}

// What looks like a slip and is none: what predicates disable, last elements, the ends of the objects.
void clean() {
  const auto p = on_heap();
  result = ZRA_LVNX16_I(vector(p.get()), 32);
  result = ZRA_LVNX16T_I(vector(p.get()), 64, ZRA_LTRN(16));
  ZRA_SVNX16T_I(result, vector(p.get()), 64, ZRA_LTRN(16));
  ZRA_SVNX16T_I(result, vector(p.get()), 4096, ZRA_LTRN(0));
  result = ZRA_LVNX8S_I(vector_at<qv_vecNx8>(p.get()), 64);
  const qv_vecNx16* moving = vector(p.get());
  ZRA_LVNX16_IP(result, &moving, 64);
  ZRA_LVNX16T_IP(result, &moving, 64, ZRA_LTRN(16));
  result = ZRA_GATHERDNX16(ZRA_GATHERANX16(p.get(), offsets(94)));
  result = ZRA_GATHERDNX16(ZRA_GATHERANX16T(p.get(), offsets(96), ZRA_LTRN(31)));
  ZRA_SCATTERNX16T(result, p.get(), offsets(96), ZRA_LTRN(31));
  ZRA_SSNX16_I(result, p.get(), 94);
  result = int16_mtor_qv_vecNx16(p.get(), 95);
  const qv_int16 lane = qv_vecNx16_mtor_qv_int16(vector(p.get()), 94);
  qv_int16_rtom_qv_int8(lane, reinterpret_cast<const qv_int8*>(p.get()), 95);
}
void last_byte() {
  const auto p = on_heap();
  (void)ZRA_GATHERANX8U(reinterpret_cast<const unsigned char*>(p.get()), offsets(95));  // slip: last_byte
}
void disabled() {
  const auto p = on_heap();
  result = ZRA_LVNX16T_I(vector(p.get()), 64, ZRA_LTRN(16));  // slip: disabled
}

const std::map<std::string, void (*)()> modes = {{"load", load},
                                                 {"before", before},
                                                 {"predicated", predicated},
                                                 {"widening", widening},
                                                 {"store", store},
                                                 {"predicated_store", predicated_store},
                                                 {"pointer", pointer},
                                                 {"element", element},
                                                 {"gather", gather},
                                                 {"scatter", scatter},
                                                 {"increment", increment},
                                                 {"stack", stack},
                                                 {"global", of_globals},
                                                 {"freed", freed},
                                                 {"copied", copied},
                                                 {"converted", converted},
                                                 {"operand", operand},
                                                 {"words", words},
                                                 {"two", two},
                                                 {"clean", clean},
                                                 {"last_byte", last_byte},
                                                 {"disabled", disabled}};

}  // namespace

int main(int argc, char** argv) {
  modes.at(argc > 1 ? argv[1] : "")();
  std::puts("finished");
}
