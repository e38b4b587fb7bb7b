// The ports: which handlers an intrinsic calls, in which order, with what; and how the program ends when
// one of them is missing.
#include "kastarri/scalar.h"
#include "support/drivers.h"

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

class Ports : public testing::Test {
 protected:
  Ports() {
    REGISTER_PORT(IPQ)(&host_, input_entry, input_data);
    REGISTER_PORT(OPQ)(&host_, output_entry, output_data);
    REGISTER_PORT(EXPSTATE)(&host_, exported);
    REGISTER_PORT(IMPWIRE)(&host_, wire);
  }
  ~Ports() override {
    REGISTER_PORT(IPQ)(nullptr, nullptr, nullptr);
    REGISTER_PORT(OPQ)(nullptr, nullptr, nullptr);
    REGISTER_PORT(EXPSTATE)(nullptr, nullptr);
    REGISTER_PORT(IMPWIRE)(nullptr, nullptr);
    core.states.EXPSTATE = 0;
  }

  // The calls that the operation makes when entry handlers answer as listed, all of which it has to ask.
  template <class Operation>
  std::string calls(std::vector<unsigned> answers, Operation operation) {
    host_ = Host();
    host_.answers = std::move(answers);
    operation();
    EXPECT_TRUE(host_.answers.empty()) << "too few entry calls: " << host_.calls;
    return host_.calls;
  }

  Host host_;
};
using PortsDeathTest = Ports;

TEST_F(Ports, BlockingTransfersAskNoEntryHandler) {
  EXPECT_EQ(calls({}, [] { EXPECT_EQ(PORT(READ_IPQ)(), 101u); }), "data0");
  EXPECT_EQ(calls({}, [] { PORT(WRITE_OPQ)(7); }), "data0=7");
}

TEST_F(Ports, ChecksSayWhenATransferWouldWait) {
  for (unsigned answer : {0u, 1u, 5u, 0x80000000u}) {
    const std::string call = "entry=" + std::to_string(answer);
    EXPECT_EQ(calls({answer}, [=] { EXPECT_EQ(PORT(CHECK_IPQ)(), answer == 0); }), call);
    EXPECT_EQ(calls({answer}, [=] { EXPECT_EQ(PORT(CHECK_OPQ)(), answer == 0); }), call);
  }
}

TEST_F(Ports, NonBlockingRead) {
  struct {
    std::vector<unsigned> answers;
    const char* calls;
    unsigned value, ok;
  } const cases[] = {
      {{1, 1}, "entry=1 data1 entry=1 data0", 102, 1},     {{0, 6}, "entry=0 entry=6 data0", 101, 1},
      {{0, 0, 0}, "entry=0 entry=0 entry=0", 42, 0},       {{0, 0, 2}, "entry=0 entry=0 entry=2 data1", 42, 0},
      {{3, 0, 0}, "entry=3 data1 entry=0 entry=0", 42, 0}, {{1, 0, 1}, "entry=1 data1 entry=0 entry=1 data1", 42, 0},
  };
  for (const auto& one : cases) {
    unsigned value = 42;
    auto ok = filled<cstub_Km_ZNB_Orbis_R5_64k_rkbool>(0xFF);
    EXPECT_EQ(calls(one.answers, [&] { PORT(READ_IPQ_NBLK)(value, ok); }), one.calls);
    EXPECT_EQ(value, one.value) << one.calls;
    EXPECT_EQ(ok._[0], one.ok) << one.calls;
  }
}

TEST_F(Ports, NonBlockingWrite) {
  struct {
    std::vector<unsigned> answers;
    const char* calls;
    unsigned sent;
  } const cases[] = {
      {{1, 1}, "entry=1 data1=null entry=1 data0=7", 1},
      {{0, 9}, "entry=0 entry=9 data0=7", 1},
      {{4, 0}, "entry=4 data1=null entry=0", 0},
      {{0, 0}, "entry=0 entry=0", 0},
  };
  for (const auto& one : cases) {
    unsigned sent = 42;
    EXPECT_EQ(calls(one.answers, [&] { sent = PORT(WRITE_OPQ_NBLK)(7)._[0]; }), one.calls);
    EXPECT_EQ(sent, one.sent) << one.calls;
  }
}

TEST_F(Ports, TheExportedStateIsToldBeforeItChangesButForMaskedWrites) {
  core.states.EXPSTATE = 5;
  EXPECT_EQ(calls({}, [] { PORT(WUR_EXPSTATE)(8); }), "new=8,state=5");
  EXPECT_EQ(calls({}, [] { PORT(SETB_EXPSTATE)(33); }), "new=10,state=8");
  EXPECT_EQ(calls({}, [] { PORT(CLRB_EXPSTATE)(-29); }), "new=2,state=10");
  EXPECT_EQ(calls({}, [] { PORT(SETB_EXPSTATE)(31); }), "new=2147483650,state=2");
  EXPECT_EQ(calls({}, [] { PORT(WRMSK_EXPSTATE)(12, 10); }), "new=2147483656,state=2147483656");
  core.states.EXPSTATE = 0x12345678;
  PORT(WRMSK_EXPSTATE)(0xFFFF0000, 0x00FF00FF);
  EXPECT_EQ(core.states.EXPSTATE, 0x12FF5600u);
  EXPECT_EQ(calls({}, [] { EXPECT_EQ(PORT(RUR_EXPSTATE)(), 0x12FF5600u); }), "");
}

TEST_F(Ports, TheWireIsReadAnewEachTime) {
  EXPECT_EQ(PORT(READ_IMPWIRE)(), 101u);
  EXPECT_EQ(PORT(READ_IMPWIRE)(), 102u);
}

TEST_F(Ports, TheLastRegistrationCounts) {
  Host other;
  REGISTER_PORT(IPQ)(&other, input_entry, input_data);
  PORT(READ_IPQ)();
  EXPECT_EQ(other.calls, "data0");
  EXPECT_EQ(host_.calls, "");
}

// --- Missing handlers -----------------------------------------------------------------------------------

const std::string NO_STATE = "Error: ExportState \"EXPSTATE\" is used but not registered\n";
const std::string NO_INPUT = "Error: InputQueue \"IPQ\" is used but not registered\n";
const std::string NO_OUTPUT = "Error: OutputQueue \"OPQ\" is used but not registered\n";
const std::string NO_WIRE = "Error: ImportWire \"IMPWIRE\" is used but not registered\n";

#define EXPECT_FAILURE(STATEMENT, MESSAGE) \
  EXPECT_EXIT(STATEMENT, testing::ExitedWithCode(1), testing::Eq(std::string(MESSAGE)))

TEST_F(PortsDeathTest, UnregisteredQueues) {
  unsigned value = 0;
  cstub_Km_ZNB_Orbis_R5_64k_rkbool ok;
  REGISTER_PORT(IPQ)(&host_, nullptr, input_data);
  REGISTER_PORT(OPQ)(&host_, nullptr, output_data);
  EXPECT_FAILURE(PORT(CHECK_IPQ)(), NO_INPUT);
  EXPECT_FAILURE(PORT(READ_IPQ_NBLK)(value, ok), NO_INPUT);
  EXPECT_FAILURE(PORT(CHECK_OPQ)(), NO_OUTPUT);
  EXPECT_FAILURE(PORT(WRITE_OPQ_NBLK)(1), NO_OUTPUT);
  REGISTER_PORT(IPQ)(&host_, input_entry, nullptr);
  REGISTER_PORT(OPQ)(&host_, output_entry, nullptr);
  EXPECT_FAILURE(PORT(READ_IPQ)(), NO_INPUT);
  EXPECT_FAILURE(PORT(WRITE_OPQ)(1), NO_OUTPUT);
}

// The data handler is missed after the entry handler has been asked: once when it says yes, twice when no.
TEST_F(PortsDeathTest, NonBlockingTransfersWithoutDataHandler) {
  REGISTER_PORT(IPQ)(&host_, input_entry, nullptr);
  REGISTER_PORT(OPQ)(&host_, output_entry, nullptr);
  const auto attempt = [this](std::vector<unsigned> answers, auto transfer) {
    static Host& host = host_;
    host.answers = std::move(answers);
    std::atexit([] { std::fputs(host.calls.c_str(), stderr); });
    transfer();
  };
  const auto read = [] {
    unsigned value = 0;
    cstub_Km_ZNB_Orbis_R5_64k_rkbool ok;
    PORT(READ_IPQ_NBLK)(value, ok);
  };
  const auto write = [] { PORT(WRITE_OPQ_NBLK)(1); };
  EXPECT_FAILURE(attempt({1}, read), NO_INPUT + "entry=1");
  EXPECT_FAILURE(attempt({0, 0}, read), NO_INPUT + "entry=0 entry=0");
  EXPECT_FAILURE(attempt({0, 1}, read), NO_INPUT + "entry=0 entry=1");
  EXPECT_FAILURE(attempt({1}, write), NO_OUTPUT + "entry=1");
  EXPECT_FAILURE(attempt({0, 1}, write), NO_OUTPUT + "entry=0 entry=1");
  host_.answers = {0, 0};
  EXPECT_EQ(PORT(WRITE_OPQ_NBLK)(1)._[0], 0) << "nothing is sent, so nothing is missed";
}

TEST_F(PortsDeathTest, AnUnregisteredExportedStateStays) {
  REGISTER_PORT(EXPSTATE)(nullptr, nullptr);
  const auto attempt = [](auto change) {
    core.states.EXPSTATE = 41;
    std::atexit([] { std::fprintf(stderr, "%u", core.states.EXPSTATE); });
    change();
  };
  EXPECT_FAILURE(attempt([] { PORT(WUR_EXPSTATE)(1); }), NO_STATE + "41");
  EXPECT_FAILURE(attempt([] { PORT(SETB_EXPSTATE)(1); }), NO_STATE + "41");
  EXPECT_FAILURE(attempt([] { PORT(CLRB_EXPSTATE)(0); }), NO_STATE + "41");
  EXPECT_FAILURE(attempt([] { PORT(WRMSK_EXPSTATE)(1, 1); }), NO_STATE + "41");
  core.states.EXPSTATE = 9;
  EXPECT_EQ(PORT(RUR_EXPSTATE)(), 9u) << "reading needs no handler";
}

TEST_F(PortsDeathTest, UnregisteredWire) {
  REGISTER_PORT(IMPWIRE)(nullptr, nullptr);
  EXPECT_FAILURE(PORT(READ_IMPWIRE)(), NO_WIRE);
}

}  // namespace
