// An entry for every intrinsic, under its own name: it counts the call in the thread's counters and jumps on
// to the library, with the arguments and the return address where they are. It changes eax, ecx and the flags,
// which every i386 function may.

        .text

        .type   pc_in_eax, @function
pc_in_eax:
        movl    (%esp), %eax
        ret

        .macro  entry symbol, index
        .p2align 4
        .globl  \symbol
        .type   \symbol, @function
\symbol:
        .cfi_startproc
.Lagain\@:
        call    pc_in_eax
        addl    $_GLOBAL_OFFSET_TABLE_, %eax
        movl    kastarri_profile_counters@gotntpoff(%eax), %ecx
        movl    %gs:(%ecx), %ecx
        testl   %ecx, %ecx
        jz      .Lfirst\@
        // 64 bits. Only this thread writes them, and a signal handler that counts in between leaves the carry alone.
        addl    $1, 8 * \index(%ecx)
        adcl    $0, 8 * \index + 4(%ecx)
        jmp     *kastarri_profile_targets@gotoff + 4 * \index(%eax)
.Lfirst\@:
        call    kastarri_profile_begin_thread
        jmp     .Lagain\@
        .cfi_endproc
        .size   \symbol, . - \symbol
        .endm

#define INTRINSIC(INDEX, SYMBOL) entry SYMBOL, INDEX
#include "intrinsics.inc"

        .section .note.GNU-stack, "", @progbits
