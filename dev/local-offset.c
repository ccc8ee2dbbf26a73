/* Prints the local time's offset from UTC as localtime(3) gives it, in the
 * form of date +%z (+0100): what a C program on the device tells of the
 * time. The boot tests run it where the first reader of time-zone data runs.
 */
#include <stdio.h>
#include <time.h>

int main(void) {
  const time_t now = time(NULL);
  const struct tm* local = localtime(&now);
  if (local == NULL) return 1;
  const long minutes = local->tm_gmtoff / 60;
  const long magnitude = minutes < 0 ? -minutes : minutes;
  printf("%c%02ld%02ld\n", minutes < 0 ? '-' : '+', magnitude / 60, magnitude % 60);
  return 0;
}
