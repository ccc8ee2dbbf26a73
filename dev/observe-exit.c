/* Runs PROGRAM and, once it has ended but before it is reaped, prints the
 * confinement it ended with (its capabilities, no-new-privileges and seccomp
 * lines of /proc/PID/status) on standard error as "observed: NAME VALUE"
 * lines; then exits with its status. The boot tests put it in front of vell,
 * which confines itself after it starts:
 *   observe-exit PROGRAM [ARG...]
 */
#include <stdio.h>
#include <string.h>
#include <sys/wait.h>
#include <unistd.h>

int main(int argc, char** argv) {
  if (argc < 2) {
    fputs("usage: observe-exit PROGRAM [ARG...]\n", stderr);
    return 2;
  }
  const pid_t child = fork();
  if (child == 0) {
    execv(argv[1], argv + 1);
    perror(argv[1]);
    _exit(127);
  }
  siginfo_t ended;
  if (child < 0 || waitid(P_PID, child, &ended, WEXITED | WNOWAIT) != 0) return 127;
  char path[64];
  snprintf(path, sizeof path, "/proc/%d/status", (int)child);
  FILE* status = fopen(path, "r");
  const char* names[] = {"CapInh:", "CapPrm:",     "CapEff:",  "CapBnd:",
                         "CapAmb:", "NoNewPrivs:", "Seccomp:", "Seccomp_filters:"};
  char line[256];
  while (status && fgets(line, sizeof line, status)) {
    for (size_t i = 0; i < sizeof names / sizeof *names; ++i) {
      const size_t length = strlen(names[i]);
      if (strncmp(line, names[i], length) != 0) continue;
      line[strcspn(line, "\n")] = '\0';
      fprintf(stderr, "observed: %.*s %s\n", (int)(length - 1), line,
              line + length + strspn(line + length, " \t"));
    }
  }
  if (status) fclose(status);
  int code = 0;
  waitpid(child, &code, 0);
  return WIFEXITED(code) ? WEXITSTATUS(code) : 128 + WTERMSIG(code);
}
