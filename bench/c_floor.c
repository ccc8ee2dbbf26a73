/* The C floor: the file-system calls of a steady start (links and tz_latest
 * name download 2016d.1.0 of the bench device) and nothing else. Each file
 * is read the cheapest way: open, one read, close. Built with CONFINED, it
 * first confines itself as vell does at the least cost (argv[1]: the length
 * of vell's filter), so that the two differ only by vell's own work. */
#include <err.h>
#include <fcntl.h>
#include <fts.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <unistd.h>

#ifdef CONFINED
#include "bench/floor_confinement.h"
#endif

#define DATASET "/var/db/timezone/tz/2016d.1.0"

static char buffer[8192];

static void protect(const char* path) {
  int fd = open(path, O_RDONLY | O_CLOEXEC);
  if (fd >= 0) close(fd);
}

static void read_word(const char* path) {
  int fd = open(path, O_RDONLY);
  if (fd < 0) return;
  if (read(fd, buffer, sizeof buffer - 1) < 0) buffer[0] = 0;
  close(fd);
}

static void walk(const char* directory) {
  char* paths[] = {(char*)directory, 0};
  FTS* fts = fts_open(paths, FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV, 0);
  if (fts == 0) return;
  while (fts_read(fts) != 0) {
  }
  fts_close(fts);
}

int main(int argc, char** argv) {
#ifdef CONFINED
  floor_forbid_new_privileges();
  floor_confine_writes_beneath("/var/db");
  floor_keep_dac_override();
  floor_filter(argc > 1 ? atoi(argv[1]) : 0);
#else
  (void)argc;
  (void)argv;
#endif
  protect("/var/db/timezone/");
  protect("/var/db/timezone/tz/");
  access("/var/db/icutz", F_OK);
  access("/var/db/icutz", F_OK);
  unlink("/var/db/timezone/needs_cleanup");
  unlink("/var/db/icu");
  read_word("/usr/share/zoneinfo.default/+VERSION");
  read_word("/usr/share/icu/icutzformat.txt");
  readlink("/var/db/timezone/tz_latest", buffer, 1024);
  readlink("/var/db/timezone/zoneinfo", buffer, 1024);
  read_word(DATASET "/zoneinfo/+VERSION");
  walk(DATASET "/icutz");
  read_word(DATASET "/zoneinfo/+VERSION");
  walk(DATASET "/icutz");
  warn("New update not compatible or older version: %s vs. %s", "2016d.1.0", "2016d.1.0");
  readlink("/var/db/timezone/localtime", buffer, 1024);
  return 0;
}
