// The ports, by their rows: which handlers an intrinsic calls, in which order, with what; and how the program ends when
// one of them is missing.
#include "scalar/drivers.h"

namespace {

using namespace testing_support;

#define PORT(OP) cstub_Km_ZNB_Orbis_R5_64k__KOR_rk_ioports_##OP
#define REGISTER_PORT(NAME) cstub_Km_ZNB_Orbis_R5_64k_register_##NAME

auto& core = cstub_Km_ZNB_Orbis_R5_64k_proc;

// The program's side of every port: writes down each call and answers entry handlers from a list. What
// queues and the wire deliver counts up from 101.
struct Host {
  std::string calls;
  std::vector<unsigned> answers;
  unsigned delivered = 100;

  Host();
  Host(const Host&) = delete;
  ~Host();
  void note(const std::string& call) { calls += (calls.empty() ? "" : " ") + call; }
  unsigned answer() {
    if (answers.empty()) {
      ADD_FAILURE() << "one call too many after: " << calls;
      return 0;
    }
    const unsigned next = answers.front();
    answers.erase(answers.begin());
    note("entry=" + std::to_string(next));
    return next;
  }
};

// The host of a port's record, which has to be the port's own.
template <class Public, class Internal>
Host& host_of(const Public* record, const Internal& internal, const char* name) {
  EXPECT_EQ(static_cast<const void*>(record), &internal);
  EXPECT_STREQ(record->name, name);
  EXPECT_EQ(record->width, 32u);
  return *static_cast<Host*>(record->user_object);
}

unsigned input_entry(const cstub_InputQueue_t* port) { return host_of(port, core.IPQ, "IPQ").answer(); }
void input_data(const cstub_InputQueue_t* port, unsigned flag, unsigned* data) {
  Host& host = host_of(port, core.IPQ, "IPQ");
  EXPECT_EQ(data, core.cstub_IPQ_data);
  host.note("data" + std::to_string(flag));
  *data = ++host.delivered;
}
unsigned output_entry(const cstub_OutputQueue_t* port) { return host_of(port, core.OPQ, "OPQ").answer(); }
void output_data(const cstub_OutputQueue_t* port, unsigned flag, const unsigned* data) {
  host_of(port, core.OPQ, "OPQ").note("data" + std::to_string(flag) + (data ? "=" + std::to_string(*data) : "=null"));
}
void exported(const cstub_ExportState_t* port, const unsigned* value) {
  host_of(port, core.EXPSTATE, "EXPSTATE")
      .note("new=" + std::to_string(*value) + ",state=" + std::to_string(PORT(RUR_EXPSTATE)()));
}
void wire(const cstub_ImportWire_t* port, unsigned* value) {
  Host& host = host_of(port, core.IMPWIRE, "IMPWIRE");
  EXPECT_EQ(*value, 0u) << "the buffer is clear before the handler fills it";
  *value = ++host.delivered;
}

// The last host that was made has the ports, until it is gone.
Host::Host() {
  REGISTER_PORT(IPQ)(this, input_entry, input_data);
  REGISTER_PORT(OPQ)(this, output_entry, output_data);
  REGISTER_PORT(EXPSTATE)(this, exported);
  REGISTER_PORT(IMPWIRE)(this, wire);
}
Host::~Host() {
  REGISTER_PORT(IPQ)(nullptr, nullptr, nullptr);
  REGISTER_PORT(OPQ)(nullptr, nullptr, nullptr);
  REGISTER_PORT(EXPSTATE)(nullptr, nullptr);
  REGISTER_PORT(IMPWIRE)(nullptr, nullptr);
  core.states.EXPSTATE = 0;
}

const char NO_STATE[] = "Error: ExportState \"EXPSTATE\" is used but not registered\n";
const char NO_INPUT[] = "Error: InputQueue \"IPQ\" is used but not registered\n";
const char NO_OUTPUT[] = "Error: OutputQueue \"OPQ\" is used but not registered\n";
const char NO_WIRE[] = "Error: ImportWire \"IMPWIRE\" is used but not registered\n";

}  // namespace

namespace model {

// What a row does when entry handlers answer as listed, all of which it has to ask, and the exported state is 5.
struct Case {
  std::vector<unsigned> answers;
  std::vector<testing_support::Int> operands;
  const char* calls;
  std::vector<testing_support::Int> left;  // its result, what it writes to operands, and the exported state
};

// A row's cases; the handler that it cannot do without, missing, and how the program then ends.
struct Protocol {
  std::vector<Case> cases;
  void (*remove)(void* host) = nullptr;
  const char* message = "";
};

void no_input_entry(void* host) { REGISTER_PORT(IPQ)(host, nullptr, input_data); }
void no_input_data(void* host) { REGISTER_PORT(IPQ)(host, input_entry, nullptr); }
void no_output_entry(void* host) { REGISTER_PORT(OPQ)(host, nullptr, output_data); }
void no_output_data(void* host) { REGISTER_PORT(OPQ)(host, output_entry, nullptr); }
void no_state(void* host) { REGISTER_PORT(EXPSTATE)(host, nullptr); }
void no_wire(void* host) { REGISTER_PORT(IMPWIRE)(host, nullptr); }

const Protocol rk_ioports_READ_IPQ{{{{}, {}, "data0", {101, 5}}}, no_input_data, NO_INPUT};
const Protocol rk_ioports_WRITE_OPQ{{{{}, {7}, "data0=7", {5}}}, no_output_data, NO_OUTPUT};

// A check says when a transfer would wait.
const std::vector<Case> CHECK = {{{0}, {}, "entry=0", {1, 5}},
                                 {{1}, {}, "entry=1", {0, 5}},
                                 {{5}, {}, "entry=5", {0, 5}},
                                 {{0x80000000}, {}, "entry=2147483648", {0, 5}}};
const Protocol rk_ioports_CHECK_IPQ{CHECK, no_input_entry, NO_INPUT};
const Protocol rk_ioports_CHECK_OPQ{CHECK, no_output_entry, NO_OUTPUT};

const Protocol rk_ioports_READ_IPQ_NBLK{{{{1, 1}, {42, 0xFF}, "entry=1 data1 entry=1 data0", {102, 1, 5}},
                                         {{0, 6}, {42, 0xFF}, "entry=0 entry=6 data0", {101, 1, 5}},
                                         {{0, 0, 0}, {42, 0xFF}, "entry=0 entry=0 entry=0", {42, 0, 5}},
                                         {{0, 0, 2}, {42, 0xFF}, "entry=0 entry=0 entry=2 data1", {42, 0, 5}},
                                         {{3, 0, 0}, {42, 0xFF}, "entry=3 data1 entry=0 entry=0", {42, 0, 5}},
                                         {{1, 0, 1}, {42, 0xFF}, "entry=1 data1 entry=0 entry=1 data1", {42, 0, 5}}},
                                        no_input_entry,
                                        NO_INPUT};
const Protocol rk_ioports_WRITE_OPQ_NBLK{{{{1, 1}, {7}, "entry=1 data1=null entry=1 data0=7", {1, 5}},
                                          {{0, 9}, {7}, "entry=0 entry=9 data0=7", {1, 5}},
                                          {{4, 0}, {7}, "entry=4 data1=null entry=0", {0, 5}},
                                          {{0, 0}, {7}, "entry=0 entry=0", {0, 5}}},
                                         no_output_entry,
                                         NO_OUTPUT};

// The handler is told before the state changes, but of a masked write.
const Protocol rk_ioports_RUR_EXPSTATE{{{{}, {}, "", {5, 5}}}};
const Protocol rk_ioports_WUR_EXPSTATE{
    {{{}, {8}, "new=8,state=5", {8}}, {{}, {-1}, "new=4294967295,state=5", {0xFFFFFFFF}}}, no_state, NO_STATE};
const Protocol rk_ioports_SETB_EXPSTATE{{{{}, {33}, "new=7,state=5", {7}},
                                         {{}, {31}, "new=2147483653,state=5", {0x80000005}},
                                         {{}, {-32}, "new=5,state=5", {5}}},
                                        no_state,
                                        NO_STATE};
const Protocol rk_ioports_CLRB_EXPSTATE{
    {{{}, {-30}, "new=1,state=5", {1}}, {{}, {32}, "new=4,state=5", {4}}, {{}, {1}, "new=5,state=5", {5}}},
    no_state,
    NO_STATE};
const Protocol rk_ioports_WRMSK_EXPSTATE{{{{}, {12, 10}, "new=13,state=13", {13}},
                                          {{}, {0xFFFF0000, 0x00FF00FF}, "new=16711680,state=16711680", {0xFF0000}}},
                                         no_state,
                                         NO_STATE};

const Protocol rk_ioports_READ_IMPWIRE{{{{}, {}, "", {101, 5}}}, no_wire, NO_WIRE};

}  // namespace model

namespace {

// Calls f. What it leaves: its result, then the operands to which it writes, then the exported state.
template <class R, class... A, std::size_t... I>
std::vector<Int> left_by(R (*f)(A...), const std::vector<Int>& given, std::index_sequence<I...>) {
  core.states.EXPSTATE = 5;
  std::tuple<bare<A>...> operands{operand<bare<A>>(given.at(I))...};
  std::vector<Int> all;
  if constexpr (std::is_void_v<R>) {
    f(std::get<I>(operands)...);
  } else {
    all.push_back(number(f(std::get<I>(operands)...)));
  }
  ((std::is_reference_v<A> ? all.push_back(number(std::get<I>(operands))) : void()), ...);
  all.push_back(core.states.EXPSTATE);
  return all;
}

#define EXPECT_FAILURE(STATEMENT, MESSAGE) \
  EXPECT_EXIT(STATEMENT, testing::ExitedWithCode(1), testing::Eq(std::string(MESSAGE)))

// Ends the program after it has said whom the last call reached, and the exported state.
template <class Call>
void failing(Host& host, Call call) {
  static Host& asked = host;
  std::atexit([] { std::fprintf(stderr, "%s state=%u", asked.calls.c_str(), core.states.EXPSTATE); });
  call();
}

template <class R, class... A>
void drive(const char* name, const model::Protocol& protocol, R (*f)(A...)) {
  const std::index_sequence_for<A...> every{};
  for (const auto& one : protocol.cases) {
    Host host;
    host.answers = one.answers;
    EXPECT_EQ(left_by(f, one.operands, every), one.left) << name << ": " << one.calls;
    EXPECT_EQ(host.calls, one.calls) << name;
    EXPECT_TRUE(host.answers.empty()) << name << ", too few entry calls: " << host.calls;
  }
  const auto& operands = protocol.cases[0].operands;
  if (protocol.remove) {
    Host host;
    protocol.remove(&host);
    EXPECT_FAILURE(failing(host, [&] { left_by(f, operands, every); }), protocol.message + std::string(" state=5"))
        << name;
  } else {
    left_by(f, operands, every);
  }
}

#define ENTRY(SYMBOL, SHAPE, ...) \
  const int tested_##SYMBOL =     \
      add_test("PortsDeathTest", #SYMBOL, [] { drive(#SYMBOL, model::SYMBOL, &KASTARRI_SYMBOL(SYMBOL)); });

#include "frame/rows.h"

#include "scalar/ports.def"

#include "frame/rows_end.h"

TEST(PortHandlers, TheWireIsReadAnewEachTime) {
  const Host host;
  EXPECT_EQ(PORT(READ_IMPWIRE)(), 101u);
  EXPECT_EQ(PORT(READ_IMPWIRE)(), 102u);
}

TEST(PortHandlers, TheLastRegistrationCounts) {
  const Host first, last;
  PORT(READ_IPQ)();
  EXPECT_EQ(last.calls, "data0");
  EXPECT_EQ(first.calls, "");
}

// The data handler is missed after the entry handler has been asked: once when it says yes, twice when no.
TEST(PortHandlersDeathTest, NonBlockingTransfersWithoutDataHandler) {
  Host host;
  model::no_input_data(&host);
  model::no_output_data(&host);
  const auto attempt = [&host](std::vector<unsigned> answers, auto transfer) {
    host.answers = std::move(answers);
    failing(host, transfer);
  };
  const auto read = [] {
    unsigned value = 0;
    cstub_Km_ZNB_Orbis_R5_64k_rkbool ok;
    PORT(READ_IPQ_NBLK)(value, ok);
  };
  const auto write = [] { PORT(WRITE_OPQ_NBLK)(1); };
  EXPECT_FAILURE(attempt({1}, read), std::string(NO_INPUT) + "entry=1 state=0");
  EXPECT_FAILURE(attempt({0, 0}, read), std::string(NO_INPUT) + "entry=0 entry=0 state=0");
  EXPECT_FAILURE(attempt({0, 1}, read), std::string(NO_INPUT) + "entry=0 entry=1 state=0");
  EXPECT_FAILURE(attempt({1}, write), std::string(NO_OUTPUT) + "entry=1 state=0");
  EXPECT_FAILURE(attempt({0, 1}, write), std::string(NO_OUTPUT) + "entry=0 entry=1 state=0");
  host.answers = {0, 0};
  EXPECT_EQ(PORT(WRITE_OPQ_NBLK)(1)._[0], 0) << "nothing is sent, so nothing is missed";
}

}  // namespace
