// Which vector instructions the analysis may use on this processor, decided
// once per process.
//
// Code built with wider instructions than the baseline goes into its own
// inline namespace (CLIPWEAVER_ISA), so that an inline function or template
// compiled in both kinds of translation unit stays two functions and the
// linker never hands the wide build to the baseline callers.
#ifndef CLIPWEAVER_BASE_INSTRUCTION_SET_H_
#define CLIPWEAVER_BASE_INSTRUCTION_SET_H_

// The vector vocabularies take SSE2 or NEON where the target has them. A
// build defining CLIPWEAVER_PLAIN_VECTORS takes their plain-array forms, the
// ones other targets (32-bit ARM among them) run, so that any machine can
// test those too.
#if defined(CLIPWEAVER_PLAIN_VECTORS)
#elif defined(__SSE2__)
#define CLIPWEAVER_SSE2 1
#elif defined(__ARM_NEON) && defined(__aarch64__)
#define CLIPWEAVER_NEON 1
#endif

#if defined(__AVX__)
#define CLIPWEAVER_ISA isa_avx
#else
#define CLIPWEAVER_ISA isa_base
#endif

namespace instruction_set {

// True where the processor and the system support AVX, unless the
// environment sets CLIPWEAVER_NO_AVX (to run the baseline kernels on such a
// machine too).
bool HasAvx();

}  // namespace instruction_set

#endif  // CLIPWEAVER_BASE_INSTRUCTION_SET_H_
