/// The processor's state block, its external ports and its failures.
///
/// The core's state outside its registers is one global record, proc. It is there, with the values below,
/// from the moment the library is loaded; nothing resets it and nothing locks it: it belongs to the one
/// thread of execution that the library models. A program may read and set states directly.
#ifndef KASTARRI_STATE_H
#define KASTARRI_STATE_H

#include "kastarri/library.h"

/* The ports.

   The core talks to the world through four ports, each 32 bits wide: an exported state, an input queue, an
   output queue and an imported wire. The program attaches handlers to a port with one of the register_
   functions below; the port's intrinsics (RK_READ_IPQ, ...) then call them. Registering again replaces what
   was registered before; null is accepted and means not registered. An intrinsic that needs a handler which
   is not registered prints one line to the standard error stream and ends the program with exit status 1.

   Every handler is called with the record of its port, where it finds its own object again. Values are
   arrays of (width + 31) / 32 words: one word here. Pointers to values hold only during the call.

   A queue has two handlers. The entry handler says whether the transfer can happen now: nonzero when an
   entry can be taken from the input queue, or put into the output queue. It changes nothing, and it may
   answer differently each time it is asked. The data handler does the transfer. Its flag is

     0: transfer one entry. Input: take the oldest entry and write it to `data`. Output: append `*data`.
     1: an attempt is under way. The handler may make ready, and must neither take nor append an entry:
        a call with flag 0 follows if the transfer happens. Input: `data` is the queue's buffer, and what is
        written there is ignored unless the program reads it itself. Output: `data` is null.

   Which handlers an intrinsic calls, in this order:

     RK_READ_IPQ        data(0); the result is the word it wrote. The queue waits, if it has to, in this call.
     RK_CHECK_IPQ       entry: 1 when the answer is 0 (nothing to read), else 0.
     RK_READ_IPQ_NBLK   entry; if nonzero, data(1). Then entry again: if this answer is nonzero, data(0), the
                        value is the word it wrote and ok is 1; if it is 0, entry a third time and, if that is
                        nonzero, data(1); the value stays as it was and ok is 0.
     RK_WRITE_OPQ       data(0) with the value. The queue waits, if it has to, in this call.
     RK_CHECK_OPQ       entry: 1 when the answer is 0 (no room to write), else 0.
     RK_WRITE_OPQ_NBLK  entry; if nonzero, data(1). Then entry again: if this answer is nonzero, data(0) with
                        the value and the result is 1, else the result is 0.
     RK_WUR_EXPSTATE, RK_SETB_EXPSTATE, RK_CLRB_EXPSTATE
                        the handler with the new value, then states.EXPSTATE is set to it.
     RK_WRMSK_EXPSTATE  states.EXPSTATE is set to the new value, then the handler with it.
     RK_RUR_EXPSTATE    no handler: the result is states.EXPSTATE.
     RK_READ_IMPWIRE    the handler, with a word that is 0 before; the result is what it left there.

   examples/ports is a whole program with handlers. */

/// What the exported state's handler is told. All kinds of port have the same members.
typedef struct cstub_ExportState_struct {
  void* user_object;  ///< what the program registered
  const char* name;   ///< "EXPSTATE"
  unsigned width;     ///< in bits
} cstub_ExportState_t, cstub_ExportState_struct_t;

/// What the input queue's handlers are told.
typedef struct cstub_InputQueue_struct {
  void* user_object;
  const char* name;  ///< "IPQ"
  unsigned width;
} cstub_InputQueue_t, cstub_InputQueue_struct_t;

/// What the output queue's handlers are told.
typedef struct cstub_OutputQueue_struct {
  void* user_object;
  const char* name;  ///< "OPQ"
  unsigned width;
} cstub_OutputQueue_t, cstub_OutputQueue_struct_t;

/// What the imported wire's handler is told.
typedef struct cstub_ImportWire_struct {
  void* user_object;
  const char* name;  ///< "IMPWIRE"
  unsigned width;
} cstub_ImportWire_t, cstub_ImportWire_struct_t;

/// The exported state's handler, with the new value.
typedef void (*cstub_ExportState_func_t)(const cstub_ExportState_t* port, const unsigned* value);
/// Nonzero when an entry can be taken from the input queue now.
typedef unsigned (*cstub_InputQueue_Entry_func_t)(const cstub_InputQueue_t* port);
/// Takes an entry, or makes ready, as `flag` has it; see above.
typedef void (*cstub_InputQueue_Data_func_t)(const cstub_InputQueue_t* port, unsigned flag, unsigned* data);
/// Nonzero when an entry can be put into the output queue now.
typedef unsigned (*cstub_OutputQueue_Entry_func_t)(const cstub_OutputQueue_t* port);
/// Appends an entry, or makes ready, as `flag` has it; see above.
typedef void (*cstub_OutputQueue_Data_func_t)(const cstub_OutputQueue_t* port, unsigned flag, const unsigned* data);
/// Writes the imported wire's value.
typedef void (*cstub_ImportWire_func_t)(const cstub_ImportWire_t* port, unsigned* value);

/// The exported state: `handler` sees every value that the core gives it.
KASTARRI_API void cstub_Km_ZNB_Orbis_R5_64k_register_EXPSTATE(void* user_object, cstub_ExportState_func_t handler);

/// The input queue, which the core reads.
KASTARRI_API void cstub_Km_ZNB_Orbis_R5_64k_register_IPQ(void* user_object, cstub_InputQueue_Entry_func_t entry,
                                                         cstub_InputQueue_Data_func_t data);

/// The output queue, which the core writes.
KASTARRI_API void cstub_Km_ZNB_Orbis_R5_64k_register_OPQ(void* user_object, cstub_OutputQueue_Entry_func_t entry,
                                                         cstub_OutputQueue_Data_func_t data);

/// The imported wire: `handler` writes the wire's present value.
KASTARRI_API void cstub_Km_ZNB_Orbis_R5_64k_register_IMPWIRE(void* user_object, cstub_ImportWire_func_t handler);

/* The state block. */

/// The library's own record of the exported state: the public record, which handlers are given, and the handlers.
typedef struct cstub_Km_ZNB_Orbis_R5_64k_ExportState_Internal {
  void* user_object;
  const char* name;
  unsigned width;
  cstub_ExportState_func_t handler;
} cstub_Km_ZNB_Orbis_R5_64k_ExportState_Internal_t;

/// The same of the input queue.
typedef struct cstub_Km_ZNB_Orbis_R5_64k_InputQueue_Internal {
  void* user_object;
  const char* name;
  unsigned width;
  unsigned* data;  ///< the buffer that the data handler fills; null until the port is registered
  cstub_InputQueue_Entry_func_t entry_handler;
  cstub_InputQueue_Data_func_t data_handler;
} cstub_Km_ZNB_Orbis_R5_64k_InputQueue_Internal_t;

/// The same of the output queue.
typedef struct cstub_Km_ZNB_Orbis_R5_64k_OutputQueue_Internal {
  void* user_object;
  const char* name;
  unsigned width;
  cstub_OutputQueue_Entry_func_t entry_handler;
  cstub_OutputQueue_Data_func_t data_handler;
} cstub_Km_ZNB_Orbis_R5_64k_OutputQueue_Internal_t;

/// The same of the imported wire.
typedef struct cstub_Km_ZNB_Orbis_R5_64k_ImportWire_Internal {
  void* user_object;
  const char* name;
  unsigned width;
  cstub_ImportWire_func_t handler;
} cstub_Km_ZNB_Orbis_R5_64k_ImportWire_Internal_t;

/// The state registers. They start at 0 but where a value is given. The intrinsics use SAR, RoundMode,
/// StickyFlags, StickyEnable and EXPSTATE; the others keep what a program stores in them.
typedef struct cstub_Km_ZNB_Orbis_R5_64k_states {
  unsigned RKSYNC;
  unsigned VECBASE;  ///< 0x840000
  unsigned VECBASELOCK;
  unsigned EPC;
  unsigned PSDIEXC;  ///< 1
  unsigned PSDI;     ///< 1
  unsigned PSRING;
  unsigned PSSTACK;
  unsigned PSENTRYNR;
  unsigned WB_S;  ///< 1
  unsigned WB_P;
  unsigned WB_C;
  unsigned WB_N;
  unsigned WB_T;
  unsigned WB_M;
  unsigned REV8AR;
  unsigned MS_DISPST;  ///< 2
  unsigned EXCCAUSE;
  unsigned EXCINF;
  unsigned EXCVADDR;
  unsigned ISB;  ///< 0x2813fd70
  unsigned ISL;
  unsigned KSL;
  unsigned PSSS;
  unsigned MS_DE;
  unsigned InOCDMode;
  unsigned ActivePriority;
  unsigned ActiveInterrupt;
  unsigned ActiveFairness;
  unsigned SecondPriority;
  unsigned SecondInterrupt;
  unsigned SecondFairness;
  unsigned CurrentPriority;
  unsigned LBEG;
  unsigned LEND;
  unsigned MEMCTL;  ///< 9
  unsigned SAR;     ///< amount, 0 to 63 in bits 0-5, of the scalar core's funnel shifts
  unsigned MISC0;
  unsigned MISC1;
  unsigned MPUNUMENTRIES;  ///< 0x10
  unsigned APB0CFG;        ///< 0x29000013
  unsigned DBREAKA0;
  unsigned DBREAKC0;
  unsigned DBREAKC_SG0;
  unsigned DBREAKA1;
  unsigned DBREAKC1;
  unsigned DBREAKC_SG1;
  unsigned IBREAKA0;
  unsigned IBREAKC0;
  unsigned IBREAKA1;
  unsigned IBREAKC1;
  unsigned CCOMPARE0;
  unsigned CCOMPARE1;
  unsigned CCOMPARE2;
  unsigned IRAM0CFG;  ///< 0x28000010
  unsigned DRAM0CFG;  ///< 0x28100011
  unsigned DRAM1CFG;  ///< 0x28120011
  unsigned PREFCTL;
  unsigned CACHEADRDIS;
  unsigned MPUENB;
  unsigned MPULOCK;
  unsigned CPENABLE;  ///< 0x7f
  unsigned ATOMCTL;   ///< 0x28
  unsigned ERI_RAW_INTERLOCK;
  unsigned ERACCESS;
  unsigned RoundMode;     ///< bits 0-1: 0 to nearest, 1 toward zero, 2 toward +infinity, 3 toward -infinity
  unsigned StickyFlags;   ///< bit 0 inexact, 1 underflow, 2 overflow, 3 division by zero, 4 invalid
  unsigned StickyEnable;  ///< bit by bit as StickyFlags; it enables nothing: no operation traps
  unsigned ZRA_FS0[2];    ///< ZRA_FS0 to ZRA_FS7: 64-bit states of the vector unit, low word first
  unsigned ZRA_FS1[2];
  unsigned ZRA_FS2[2];
  unsigned ZRA_FS3[2];
  unsigned ZRA_FS4[2];
  unsigned ZRA_FS5[2];
  unsigned ZRA_FS6[2];
  unsigned ZRA_FS7[2];
  unsigned EXPSTATE;  ///< present value of the exported state
} cstub_Km_ZNB_Orbis_R5_64k_states_t;

/// What a program may register for the general multiplies of wide vectors.
typedef void (*cstub_mulpp_inplace)(unsigned*, const unsigned*);

/// Functions of the program, kept for it: this library multiplies by itself and calls none.
typedef struct cstub_callbacks {
  cstub_mulpp_inplace mulpp_inplace;
} cstub_callbacks_t;

/// All that the core is outside its registers: states, ports, callbacks.
typedef struct cstub_Km_ZNB_Orbis_R5_64k_processor {
  cstub_Km_ZNB_Orbis_R5_64k_states_t states;
  cstub_Km_ZNB_Orbis_R5_64k_ExportState_Internal_t EXPSTATE;
  cstub_Km_ZNB_Orbis_R5_64k_InputQueue_Internal_t IPQ;
  unsigned cstub_IPQ_data[1];  ///< the input queue's buffer: one entry
  cstub_Km_ZNB_Orbis_R5_64k_OutputQueue_Internal_t OPQ;
  cstub_Km_ZNB_Orbis_R5_64k_ImportWire_Internal_t IMPWIRE;
  cstub_callbacks_t callbacks;
  int PRID;  ///< the processor's number, 0 until the program sets it
  void* last;
} cstub_Km_ZNB_Orbis_R5_64k_processor_t;

/// The processor. Where its members lie, in bytes, for programs that reach it without this header: pointers take 4
/// bytes in a 32-bit program and 8 in a 64-bit one.
///
///            states  EXPSTATE  IPQ  cstub_IPQ_data  OPQ  IMPWIRE  callbacks  PRID  last  in all
///   32 bits       0       340  356             380  384      404        420   424   428     432
///   64 bits       0       344  376             424  432      472        504   512   520     528
extern KASTARRI_API cstub_Km_ZNB_Orbis_R5_64k_processor_t cstub_Km_ZNB_Orbis_R5_64k_proc;

/// Merges bytes of a word: byte j (byte 0 the lowest) of entry k is 0x00 where bit j of k is 1, else 0xFF.
/// The library reads this table and never writes it.
extern KASTARRI_API unsigned cstub_Km_ZNB_Orbis_R5_64k_mask[16];

/// What a load or store does at an address that it cannot use: prints the address to the standard error stream
/// and ends the program with exit status 1. Intrinsics print all of a 64-bit address.
KASTARRI_API void cstub_vaddr_not_aligned(unsigned address) __attribute__((noreturn));

#endif
