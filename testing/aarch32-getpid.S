// A 32-bit ARM program for the filter's architecture check on arm64: it
// asks getpid once and ends by SIGILL if refused (-EPERM), by SIGSEGV if not.
        .arm
        .global _start
_start:
        mov     r7, #20
        svc     #0
        cmn     r0, #1
        bne     1f
        udf     #0
1:      mov     r0, #0
        ldr     r0, [r0]
