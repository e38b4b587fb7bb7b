// The external ports: registration of handlers and the intrinsics that call them. Which handlers are called,
// with which flag and in which order is a protocol that programs rely on, so the steps below may neither be
// reordered nor merged. A handler may register others: every call looks the handler up anew.
#include "frame/entry.h"
#include "frame/failure.h"
#include "scalar/state.h"

namespace {

// Found once an intrinsic, where processor() would be found anew after every handler.
cstub_Km_ZNB_Orbis_R5_64k_processor_t& core = cstub_Km_ZNB_Orbis_R5_64k_proc;

// What handlers are given of a port: its internal record begins with the members of the public one.
template <class Public, class Port>
const Public* public_record(const Port& port) {
  return reinterpret_cast<const Public*>(&port);
}

template <class Handler>
Handler needed(Handler handler, const char* kind, const char* name) {
  if (!handler) kastarri::fail("Error: %s \"%s\" is used but not registered\n", kind, name);
  return handler;
}

// --- Input queue ----------------------------------------------------------------------------------------

const auto* input_queue() { return public_record<cstub_InputQueue_t>(core.IPQ); }

bool input_ready() { return needed(core.IPQ.entry_handler, "InputQueue", core.IPQ.name)(input_queue()) != 0; }

auto input_data_handler() { return needed(core.IPQ.data_handler, "InputQueue", core.IPQ.name); }

void fetch(unsigned flag) { input_data_handler()(input_queue(), flag, core.IPQ.data); }

word read_input() {
  fetch(0);
  return core.IPQ.data[0];
}

void read_input_now(unsigned& value, rkbool& ok) {
  if (input_ready()) fetch(1);
  const bool ready = input_ready();
  input_data_handler();  // missed even where it would not be called
  if (ready) {
    value = read_input();
  } else if (input_ready()) {
    fetch(1);
  }
  ok._[0] = ready;
}

// --- Output queue ---------------------------------------------------------------------------------------

const auto* output_queue() { return public_record<cstub_OutputQueue_t>(core.OPQ); }

bool output_ready() { return needed(core.OPQ.entry_handler, "OutputQueue", core.OPQ.name)(output_queue()) != 0; }

void send(unsigned flag, const word* data) {
  needed(core.OPQ.data_handler, "OutputQueue", core.OPQ.name)(output_queue(), flag, data);
}

rkbool write_output_now(word value) {
  if (output_ready()) send(1, nullptr);
  rkbool sent;
  sent._[0] = output_ready();
  if (sent._[0]) send(0, &value);
  return sent;
}

// --- Exported state -------------------------------------------------------------------------------------

auto state_handler() { return needed(core.EXPSTATE.handler, "ExportState", core.EXPSTATE.name); }

const auto* exported_state() { return public_record<cstub_ExportState_t>(core.EXPSTATE); }

void export_state(word value) {
  state_handler()(exported_state(), &value);
  core.states.EXPSTATE = value;
}

void export_masked(word value, word mask) {
  const auto handler = state_handler();
  const word merged = (core.states.EXPSTATE & ~mask) | (value & mask);
  core.states.EXPSTATE = merged;
  handler(exported_state(), &merged);
}

// --- Imported wire --------------------------------------------------------------------------------------

word read_wire() {
  const auto handler = needed(core.IMPWIRE.handler, "ImportWire", core.IMPWIRE.name);
  word value = 0;
  handler(public_record<cstub_ImportWire_t>(core.IMPWIRE), &value);
  return value;
}

}  // namespace

void cstub_Km_ZNB_Orbis_R5_64k_register_EXPSTATE(void* user_object, cstub_ExportState_func_t handler) {
  core.EXPSTATE.user_object = user_object;
  core.EXPSTATE.handler = handler;
}

void cstub_Km_ZNB_Orbis_R5_64k_register_IPQ(void* user_object, cstub_InputQueue_Entry_func_t entry,
                                            cstub_InputQueue_Data_func_t data) {
  core.IPQ.user_object = user_object;
  core.IPQ.data = core.cstub_IPQ_data;
  core.IPQ.entry_handler = entry;
  core.IPQ.data_handler = data;
}

void cstub_Km_ZNB_Orbis_R5_64k_register_OPQ(void* user_object, cstub_OutputQueue_Entry_func_t entry,
                                            cstub_OutputQueue_Data_func_t data) {
  core.OPQ.user_object = user_object;
  core.OPQ.entry_handler = entry;
  core.OPQ.data_handler = data;
}

void cstub_Km_ZNB_Orbis_R5_64k_register_IMPWIRE(void* user_object, cstub_ImportWire_func_t handler) {
  core.IMPWIRE.user_object = user_object;
  core.IMPWIRE.handler = handler;
}

#include "scalar/stamp.h"

#include "scalar/ports.def"

#include "frame/rows_end.h"
