// The host's side of the ports: the input queue delivers the samples of one file, the output queue collects
// those of another, the imported wire is the volume, the exported state moves a progress bar.
#ifndef KASTARRI_EXAMPLES_PORTS_HOST_H
#define KASTARRI_EXAMPLES_PORTS_HOST_H

#include <kastarri.h>

#include <cstddef>
#include <vector>

#include "common/progress.h"

namespace examples {

// A queue whose other end is not always there. With a length of 5, it takes or gives five entries, then says no to
// five questions whether it is ready, then takes or gives five again. So a kernel that polls meets both answers.
class Bursts {
 public:
  explicit Bursts(unsigned length) : length_(length) {}
  bool ready() {
    if (away_ == 0) return true;
    --away_;
    return false;
  }
  void transferred() {
    if (++count_ % length_ == 0) away_ = length_;
  }

 private:
  unsigned length_, count_ = 0, away_ = 0;
};

// Connects the ports to samples. Handlers find the host again as the port's user_object, so one has to live
// as long as the kernel runs.
class Host {
 public:
  Host(const std::vector<short>& samples, int gain, Progress& progress)
      : input_(samples), gain_(gain), progress_(progress) {
    cstub_Km_ZNB_Orbis_R5_64k_register_IPQ(this, input_entry, input_data);
    cstub_Km_ZNB_Orbis_R5_64k_register_OPQ(this, output_entry, output_data);
    cstub_Km_ZNB_Orbis_R5_64k_register_IMPWIRE(this, volume);
    cstub_Km_ZNB_Orbis_R5_64k_register_EXPSTATE(this, done);
  }
  Host(const Host&) = delete;
  Host& operator=(const Host&) = delete;

  int entries() const { return static_cast<int>((input_.size() + 1) / 2); }
  // What the kernel wrote. An odd number of samples was filled up to a whole entry.
  std::vector<short> output() const {
    std::vector<short> samples = output_;
    samples.resize(input_.size());
    return samples;
  }

 private:
  template <class Port>
  static Host& host(const Port* port) {
    return *static_cast<Host*>(port->user_object);
  }

  unsigned sample(std::size_t n) const { return n < input_.size() ? static_cast<unsigned short>(input_[n]) : 0; }

  // --- Input queue: flag 1 announces an attempt, flag 0 takes an entry ---------------------------------------
  static unsigned input_entry(const cstub_InputQueue_t* port) {
    Host& h = host(port);
    return h.next_ < h.input_.size() && h.source_.ready();
  }
  static void input_data(const cstub_InputQueue_t* port, unsigned flag, unsigned* data) {
    if (flag != 0) return;
    Host& h = host(port);
    *data = h.sample(h.next_) | h.sample(h.next_ + 1) << 16;
    h.next_ += 2;
    h.source_.transferred();
  }

  // --- Output queue: flag 1 announces an attempt, with no data, flag 0 appends an entry ------------------------
  static unsigned output_entry(const cstub_OutputQueue_t* port) { return host(port).sink_.ready(); }
  static void output_data(const cstub_OutputQueue_t* port, unsigned flag, const unsigned* data) {
    if (flag != 0) return;
    Host& h = host(port);
    h.output_.push_back(static_cast<short>(*data & 0xFFFF));
    h.output_.push_back(static_cast<short>(*data >> 16));
    h.sink_.transferred();
  }

  static void volume(const cstub_ImportWire_t* port, unsigned* value) {
    *value = static_cast<unsigned>(host(port).gain_);
  }
  static void done(const cstub_ExportState_t* port, const unsigned* value) {
    host(port).progress_.show(*value, host(port).entries());
  }

  const std::vector<short>& input_;
  int gain_;
  Progress& progress_;
  std::vector<short> output_;
  std::size_t next_ = 0;
  Bursts source_{7}, sink_{5};
};

}  // namespace examples

#endif
