#include "call.h"

#include <algorithm>
#include <cstdint>
#include <cstring>
#include <limits>
#include <memory>
#include <utility>

#include "memory.h"
#include "operands.h"

namespace kastarri_python {

namespace {

// Values that do not lie as the library has them are converted a block at a time: as many as have room, and few enough
// to stay in the processor's nearest cache.
constexpr npy_intp most_in_block = 64;
constexpr int block_bytes = 8192;

bool is_output(Role role) { return role == Role::result || role == Role::written || role == Role::kept; }

class Call {
 public:
  Call(const Row& row, PyObject* out, PyObject* const* arguments, Py_ssize_t count)
      : row_(row), count_(row.signature->count) {
    read(arguments, arguments + count);
    keep_from_stores();
    broadcast();
    make_outputs(out);
  }

  PyObject* make() {
    run();
    if (PyErr_Occurred()) throw Raised();  // a handler of a port
    return results();
  }

 private:
  const Type& type(int i) const { return *row_.signature->types[i]; }
  const Parameter& parameter(int i) const { return row_.parameters[i]; }

  // --- Arguments ------------------------------------------------------------------------------------

  void read(PyObject* const* arguments, PyObject* const* end) {
    const auto next = [&] {
      if (arguments == end) wrong_number();
      return *arguments++;
    };
    for (int i = 0; i < count_; ++i) {
      switch (const Parameter& p = parameter(i); p.role) {
        case Role::result:
        case Role::written:
        case Role::ignored:
          break;
        case Role::immediate: {
          const int number = read_immediate(row_, p, next());
          std::memcpy(operands_[i].value, &number, sizeof number);
          break;
        }
        case Role::memory:
          memory_.open(row_, p, type(i), next());
          break;
        case Role::moving:
          memory_.open(row_, p, type(i), next());
          moving_ = i;
          read_operand(operands_[i], row_, {"offset", Role::offset, 0, 0}, TypeOf<std::int64_t>::value, next());
          break;
        case Role::offset:
          offset_ = i;
          read_operand(operands_[i], row_, p, type(i), next());
          break;
        case Role::offsets:
          offsets_ = i;
          read_operand(operands_[i], row_, p, type(i), next());
          break;
        case Role::enabled:
          enabled_ = i;
          [[fallthrough]];
        case Role::input:
        case Role::kept:
          read_operand(operands_[i], row_, p, type(i), next());
          break;
      }
    }
    if (arguments != end) wrong_number();
  }

  [[noreturn]] void wrong_number() const { raise(PyExc_SystemError, "%s: wrong number of arguments", row_.name); }

  // Operands have the values that were there before the first store.
  void keep_from_stores() {
    if (!memory_.is_written()) return;
    for (int i = 0; i < count_; ++i) {
      Operand& operand = operands_[i];
      if (operand.array && memory_.extent().meets(extent_of(operand.array.array())))
        operand.take(Ref::checked(PyArray_NewCopy(operand.array.array(), NPY_CORDER)));
    }
  }

  // The axes of all operands, aligned at the last one.
  void broadcast() {
    for (int i = 0; i < count_; ++i) axes_ = std::max(axes_, operands_[i].axes);
    std::fill(lengths_, lengths_ + axes_, 1);
    for (int i = 0; i < count_; ++i) {
      const Operand& operand = operands_[i];
      for (int k = 0; k < operand.axes; ++k) {
        npy_intp& length = lengths_[axes_ - operand.axes + k];
        if (length == 1) length = operand.lengths[k];
        if (operand.lengths[k] != length && operand.lengths[k] != 1)
          raise(PyExc_ValueError, "%s: %s has %zd registers along an axis where another operand has %zd", row_.name,
                parameter(i).name, operand.lengths[k], length);
      }
    }
  }

  void make_outputs(PyObject* out) {
    for (int pass = 0; pass < 2; ++pass) {  // the result first
      for (int i = 0; i < count_; ++i) {
        const Role role = parameter(i).role;
        if (!is_output(role) || (role == Role::result) != (pass == 0)) continue;
        // What an intrinsic may leave as it is must not be what lay in memory before.
        const bool cleared = role == Role::written && shape_of(type(i)).elements == 1;
        if (out != Py_None) {
          given_ = given_array(out, row_, type(i), axes_, lengths_);
          given_for_ = i;
        }
        out = Py_None;
        const bool is_direct = given_for_ == i && is_free(i, given_.array());
        outputs_[i] = is_direct ? Ref::to(given_.get()) : new_array(type(i), axes_, lengths_, cleared);
      }
    }
    if (moving_ >= 0) outputs_[moving_] = new_array(TypeOf<std::int64_t>::value, axes_, lengths_, false);
  }

  // Whether results may go into the given array while the call goes on: nothing that it has yet to read is changed. An
  // operand that lies there just as the results will is read before each of them, unless another is kept, which is
  // copied there first.
  bool is_free(int i, PyArrayObject* out) const {
    if (lies_alike(i) && reinterpret_cast<std::uintptr_t>(PyArray_DATA(out)) % static_cast<unsigned>(type(i).unit) != 0)
      return false;
    const Extent extent = extent_of(out);
    const bool is_copied = parameter(i).role == Role::kept && !lies_as(i, out, i);
    for (int k = 0; k < count_; ++k) {
      const Ref& array = operands_[k].array;
      if (array && extent.meets(extent_of(array.array())) && (is_copied || !lies_as(i, out, k))) return false;
    }
    return !extent.meets(memory_.extent());
  }

  bool lies_as(int i, PyArrayObject* out, int k) const {
    const Operand& operand = operands_[k];
    if (operand.type != &type(i) || operand.data != PyArray_BYTES(out)) return false;
    for (int axis = 0; axis < axes_; ++axis)
      if (lengths_[axis] > 1 && stride(operand, axis) != PyArray_STRIDE(out, axis)) return false;
    return true;
  }

  // --- Loops ----------------------------------------------------------------------------------------

  // Axes that all operands go along in equal steps are one.
  struct Loop {
    int axes = 0;
    npy_intp lengths[most_axes + 1];
    npy_intp strides[most_parameters][most_axes + 1];
  };

  npy_intp stride(const Operand& operand, int axis) const {
    const int own = axis - (axes_ - operand.axes);
    return own < 0 ? 0 : operand.strides[own];
  }

  Loop loop() const {
    Loop loop;
    for (int axis = 0; axis < axes_; ++axis) {
      if (lengths_[axis] == 1) continue;
      bool merges = loop.axes > 0;
      for (int i = 0; i < count_ && merges; ++i)
        merges = loop.strides[i][loop.axes - 1] == stride(operands_[i], axis) * lengths_[axis];
      if (!merges) loop.lengths[loop.axes++] = 1;
      loop.lengths[loop.axes - 1] *= lengths_[axis];
      for (int i = 0; i < count_; ++i) loop.strides[i][loop.axes - 1] = stride(operands_[i], axis);
    }
    if (loop.axes > 0) return loop;
    loop.axes = loop.lengths[0] = 1;
    for (int i = 0; i < count_; ++i) loop.strides[i][0] = 0;
    return loop;
  }

  void run() {
    const Loop loop = this->loop();
    const char* from[most_parameters];
    npy_intp strides[most_parameters], at[most_axes + 1] = {};
    for (int i = 0; i < count_; ++i) {
      from[i] = operands_[i].data;
      strides[i] = loop.strides[i][loop.axes - 1];
      is_direct_[i] = operands_[i].data && operands_[i].is_direct() && !(operands_[i].array && is_tested(i));
      if (outputs_[i]) to_[i] = PyArray_BYTES(outputs_[i].array());
    }
    const npy_intp inner = loop.lengths[loop.axes - 1];
    if (std::find(loop.lengths, loop.lengths + loop.axes, 0) != loop.lengths + loop.axes) return;
    const npy_intp most = works_in_place() ? inner : std::min(inner, block());
    make_scratch(most);
    for (;;) {
      for (npy_intp done = 0; done < inner; done += most) {
        const npy_intp n = std::min(most, inner - done);
        call_block(from, strides, n);
        for (int i = 0; i < count_; ++i)
          if (from[i]) from[i] += n * strides[i];
      }
      // On to the next along the axes before the last.
      int axis = loop.axes - 1;
      for (int i = 0; i < count_; ++i)
        if (from[i]) from[i] -= inner * strides[i];
      while (--axis >= 0) {
        const bool more = ++at[axis] < loop.lengths[axis];
        for (int i = 0; i < count_; ++i)
          if (from[i]) from[i] += loop.strides[i][axis] * (more ? 1 : 1 - loop.lengths[axis]);
        if (more) break;
        at[axis] = 0;
      }
      if (axis < 0) return;
    }
  }

  // Whether nothing is converted, copied or tested on the way.
  bool works_in_place() const {
    for (int i = 0; i < count_; ++i) {
      const Role role = parameter(i).role;
      if (role == Role::kept || role == Role::memory || role == Role::moving || row_.divides) return false;
      if (is_output(role) ? !lies_alike(i) : operands_[i].data && (!is_direct_[i] || has_range(i))) return false;
    }
    return true;
  }

  npy_intp block() const {
    int most_bytes = 1;
    for (int i = 0; i < count_; ++i)
      if (operands_[i].data || outputs_[i]) most_bytes = std::max(most_bytes, type(i).bytes);
    return std::min(most_in_block, npy_intp{block_bytes} / most_bytes);
  }

  bool lies_alike(int i) const { return shape_of(type(i)).lies_alike(); }
  // Whether values lie alike, but numbers may be too large.
  bool has_range(int i) const { return shape_of(type(i)).way == Way::sum48; }

  // Whether wrong values would end the program. Those that are tested have to be those that are used, whoever else
  // writes to where they lie.
  bool is_tested(int i) const { return i == offset_ || i == offsets_ || i == enabled_ || row_.divides; }

  // Bytes of a value that does not lie as the library has it.
  int scratch_bytes(int i) const {
    const Role role = parameter(i).role;
    if (role == Role::moving) return sizeof(std::int64_t);
    const bool lies_elsewhere = is_output(role) ? !lies_alike(i) : operands_[i].data && !is_direct_[i];
    return lies_elsewhere ? type(i).bytes : 0;
  }

  // Not on the stack, which is small in some threads, and where calls are many deep if handlers of ports make them.
  void make_scratch(npy_intp values) {
    constexpr npy_intp line = 64;  // of the processor's cache
    npy_intp at[most_parameters], bytes = 0;
    for (int i = 0; i < count_; ++i) {
      at[i] = bytes;
      bytes += (values * scratch_bytes(i) + line - 1) / line * line;
    }
    if (bytes == 0) return;
    room_.reset(new char[static_cast<std::size_t>(bytes + line)]);
    char* const first = room_.get() + line - reinterpret_cast<std::uintptr_t>(room_.get()) % line;
    for (int i = 0; i < count_; ++i) scratch_[i] = first + at[i];
  }

  // --- A block --------------------------------------------------------------------------------------

  void call_block(const char* const* from, const npy_intp* strides, npy_intp n) {
    for (int i = 0; i < count_; ++i) {
      const Role role = parameter(i).role;
      if (role == Role::moving) {
        read_images(i, TypeOf<std::int64_t>::value, from[i], strides[i], n, scratch_[i]);
        set_image(i, scratch_[i], sizeof(std::int64_t));
      } else if (role == Role::memory) {
        base_ = memory_.base();
        set_image(i, reinterpret_cast<char*>(&base_), 0);
      } else if (is_output(role)) {
        set_image(i, lies_alike(i) ? to_[i] : scratch_[i], type(i).bytes);
        if (role == Role::kept) read_images(i, type(i), from[i], strides[i], n, images_[i]);
      } else if (!operands_[i].data) {
        set_image(i, operands_[i].value, 0);
      } else if (is_direct_[i]) {
        set_image(i, const_cast<char*>(from[i]), strides[i]);
        if (!fit(type(i), from[i], strides[i], n)) does_not_fit(i);
      } else {
        read_images(i, type(i), from[i], strides[i], n, scratch_[i]);
        set_image(i, scratch_[i], type(i).bytes);
      }
    }
    expect_accesses(n);
    expect_quotients(n);
    row_.signature->call(row_.function, images_, image_strides_, n);
    take_outputs(n);
  }

  void set_image(int i, char* image, npy_intp stride) {
    images_[i] = image;
    image_strides_[i] = stride;
  }

  template <class T>
  T number(int i, npy_intp k) const {
    T value;
    std::memcpy(&value, images_[i] + k * image_strides_[i], sizeof value);
    return value;
  }

  void read_images(int i, const Type& type, const char* from, npy_intp stride, npy_intp n, char* images) {
    // What is kept may already lie where it will be written.
    const bool fits = from == images ? fit(type, from, stride, n) : to_images(type, from, stride, n, images);
    if (!fits) does_not_fit(i);
  }

  [[noreturn]] void does_not_fit(int i) const {
    raise(PyExc_ValueError, "%s: %s has a number that does not fit into %d bits", row_.name, parameter(i).name,
          type(i).bits);
  }

  void take_outputs(npy_intp n) {
    for (int i = 0; i < count_; ++i) {
      if (!outputs_[i]) continue;
      const bool moves = parameter(i).role == Role::moving;
      const Type& type = moves ? TypeOf<std::int64_t>::value : this->type(i);
      if (moves)
        for (npy_intp k = 0; k < n; ++k) {
          const std::int64_t offset = number<char*>(i, k) - memory_.base();
          std::memcpy(scratch_[i] + k * npy_intp{sizeof offset}, &offset, sizeof offset);
        }
      if (moves || !lies_alike(i)) to_array(type, scratch_[i], n, to_[i]);
      to_[i] += n * shape_of(type).bytes();
    }
  }

  // --- What would end the program -------------------------------------------------------------------

  void expect_accesses(npy_intp n) {
    if (moving_ >= 0) {
      for (npy_intp k = 0; k < n; ++k) {
        const auto offset = number<std::int64_t>(moving_, k);
        memory_.expect_access(offset);
        char* const pointer = memory_.base() + offset;
        std::memcpy(images_[moving_] + k * image_strides_[moving_], &pointer, sizeof pointer);
      }
    } else if (offset_ >= 0) {
      for (npy_intp k = 0; k < n; ++k) memory_.expect_access(number<std::int32_t>(offset_, k));
    } else if (offsets_ >= 0) {
      for (npy_intp k = 0; k < n; ++k) expect_elements(k);
    }
  }

  void expect_elements(npy_intp k) {
    const Type& offsets = type(offsets_);
    const char* const image = images_[offsets_] + k * image_strides_[offsets_];
    for (int i = 0; i < offsets.count; ++i) {
      if (enabled_ >= 0) {
        const int bit = parameter(enabled_).first + i;
        if (!(images_[enabled_][k * image_strides_[enabled_] + bit / 8] >> bit % 8 & 1)) continue;
      }
      // Offsets of 32 bits have a sign, those of 16 have none.
      std::int32_t wide = 0;
      std::memcpy(&wide, image + i * offsets.bits / 8, static_cast<std::size_t>(offsets.bits / 8));
      memory_.expect_element(wide);
    }
  }

  void expect_quotients(npy_intp n) {
    if (!row_.divides) return;
    for (npy_intp k = 0; k < n; ++k) {
      const auto dividend = number<std::int32_t>(0, k), divisor = number<std::int32_t>(1, k);
      if (divisor == 0) raise(PyExc_ZeroDivisionError, "%s: division by zero", row_.name);
      if (type(0).kind == 'i' && divisor == -1 && dividend == std::numeric_limits<std::int32_t>::min())
        raise(PyExc_OverflowError, "%s: the quotient of -2^31 and -1 is no number of 32 bits", row_.name);
    }
  }

  // --- Results --------------------------------------------------------------------------------------

  PyObject* results() {
    Ref found[most_parameters];
    int count = 0;
    for (int pass = 0; pass < 2; ++pass)
      for (int i = 0; i < count_; ++i)
        if (outputs_[i] && (parameter(i).role == Role::result) == (pass == 0)) found[count++] = result(i);
    if (count == 0) Py_RETURN_NONE;
    if (count == 1) return found[0].release();
    Ref all = Ref::checked(PyTuple_New(count));
    for (int i = 0; i < count; ++i) PyTuple_SET_ITEM(all.get(), i, found[i].release());
    return all.release();
  }

  // What has no axes is a number.
  Ref result(int i) {
    PyArrayObject* array = outputs_[i].array();
    if (i == given_for_) {
      if (array != given_.array() && PyArray_CopyInto(given_.array(), array) < 0) throw Raised();
      return std::move(given_);
    }
    if (parameter(i).role == Role::moving && axes_ == 0)
      return Ref::checked(PyLong_FromLongLong(*static_cast<std::int64_t*>(PyArray_DATA(array))));
    outputs_[i].release();
    return Ref::checked(PyArray_Return(array));
  }

  const Row& row_;
  const int count_;
  Operand operands_[most_parameters];
  Memory memory_;
  char* base_ = nullptr;
  int moving_ = -1, offset_ = -1, offsets_ = -1, enabled_ = -1;  // the parameters of these roles
  int axes_ = 0;
  npy_intp lengths_[most_axes];
  Ref outputs_[most_parameters];
  Ref given_;  // the program's array for the result that is this parameter's
  int given_for_ = -1;

  bool is_direct_[most_parameters];
  char* to_[most_parameters];
  char* images_[most_parameters];
  npy_intp image_strides_[most_parameters];
  char* scratch_[most_parameters];
  std::unique_ptr<char[]> room_;
};

}  // namespace

PyObject* call(const Row& row, PyObject* out, PyObject* const* arguments, Py_ssize_t count) {
  return Call(row, out, arguments, count).make();
}

}  // namespace kastarri_python
