/* The least a process can do to confine itself as vell does: each step's
 * kernel calls alone, for the confined C floor and to time beside vell's
 * own steps. Failures are ignored, as vell ignores them. */
#ifndef VELL_BENCH_FLOOR_CONFINEMENT_H_
#define VELL_BENCH_FLOOR_CONFINEMENT_H_

#ifdef __cplusplus
extern "C" {
#endif

/* prctl(PR_SET_NO_NEW_PRIVS). */
void floor_forbid_new_privileges(void);
/* A Landlock ruleset of the write rights, one rule beneath `dir`. */
void floor_confine_writes_beneath(const char* dir);
/* One capset: CAP_DAC_OVERRIDE alone. */
void floor_keep_dac_override(void);
/* A filter of `length` instructions shaped as vell's: the architecture, then
 * a balanced search over intervals of call numbers. */
void floor_filter(unsigned length);

#ifdef __cplusplus
}
#endif

#endif
