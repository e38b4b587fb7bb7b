// An entry for every intrinsic, under its own name: it counts the call in the thread's counters and jumps on
// to the library, with the arguments and the return address where they are. It changes the flags and registers that
// every function may change: eax and ecx of an i386, r11 of an x86-64.
//
// Where callers are wanted, it jumps to a detour, which notes the address to which the intrinsic returns and goes on.

        .text

#ifdef __i386__
        .type   pc_in_eax, @function
pc_in_eax:
        movl    (%esp), %eax
        ret

        .macro  count_and_go index
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
        .endm

        // On the stack lie the intrinsic's number and the return address: both are handed on.
        .type   note_caller, @function
note_caller:
        .cfi_startproc
        .cfi_def_cfa_offset 8
        movl    (%esp), %eax
        pushl   4(%esp)
        .cfi_adjust_cfa_offset 4
        pushl   %eax
        .cfi_adjust_cfa_offset 4
        call    kastarri_profile_note_caller
        addl    $12, %esp
        .cfi_adjust_cfa_offset -12
        jmp     *%eax
        .cfi_endproc
        .size   note_caller, . - note_caller

        .macro  push_number index
        pushl   $\index
        .endm
#else
        // Arguments lie in registers, and so does what a caller of variable arguments tells.
        .macro  save_arguments
        .irp    register, rax, rdi, rsi, rdx, rcx, r8, r9
        pushq   %\register
        .cfi_adjust_cfa_offset 8
        .endr
        subq    $136, %rsp
        .cfi_adjust_cfa_offset 136
        .irp    n, 0, 1, 2, 3, 4, 5, 6, 7
        movups  %xmm\n, 16 * \n(%rsp)
        .endr
        .endm

        .macro  restore_arguments
        .irp    n, 0, 1, 2, 3, 4, 5, 6, 7
        movups  16 * \n(%rsp), %xmm\n
        .endr
        addq    $136, %rsp
        .cfi_adjust_cfa_offset -136
        .irp    register, r9, r8, rcx, rdx, rsi, rdi, rax
        popq    %\register
        .cfi_adjust_cfa_offset -8
        .endr
        .endm

        // A thread's first call.
        .type   begin_thread, @function
begin_thread:
        .cfi_startproc
        save_arguments
        call    kastarri_profile_begin_thread
        restore_arguments
        ret
        .cfi_endproc
        .size   begin_thread, . - begin_thread

        // On the stack lie the intrinsic's number and the return address, below what is saved: 7 registers and 136 bytes.
        .type   note_caller, @function
note_caller:
        .cfi_startproc
        .cfi_def_cfa_offset 16
        save_arguments
        movl    192(%rsp), %edi
        movq    200(%rsp), %rsi
        call    kastarri_profile_note_caller
        movq    %rax, %r11
        restore_arguments
        addq    $8, %rsp
        .cfi_adjust_cfa_offset -8
        jmp     *%r11
        .cfi_endproc
        .size   note_caller, . - note_caller

        .macro  push_number index
        pushq   $\index
        .endm

        .macro  count_and_go index
.Lagain\@:
        movq    kastarri_profile_counters@gottpoff(%rip), %r11
        movq    %fs:(%r11), %r11
        testq   %r11, %r11
        jz      .Lfirst\@
        incq    8 * \index(%r11)
        jmp     *kastarri_profile_targets + 8 * \index(%rip)
.Lfirst\@:
        call    begin_thread
        jmp     .Lagain\@
        .endm
#endif

        .macro  entry symbol, index
        .p2align 4
        .globl  \symbol
        .type   \symbol, @function
\symbol:
        .cfi_startproc
        count_and_go \index
        .cfi_endproc
        .size   \symbol, . - \symbol
        .endm

#define INTRINSIC(INDEX, SYMBOL) entry SYMBOL, INDEX
#include "intrinsics.inc"
#undef INTRINSIC

        // A detour for every intrinsic, 16 bytes each.
        .macro  detour index
        .p2align 4
        push_number \index
        jmp     note_caller
        .endm

        .p2align 4
        .globl  kastarri_profile_detours
        .hidden kastarri_profile_detours
kastarri_profile_detours:
#define INTRINSIC(INDEX, SYMBOL) detour INDEX
#include "intrinsics.inc"

        .section .note.GNU-stack, "", @progbits
