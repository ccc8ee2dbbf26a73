// Every fixed path vell knows. Nothing else in the tool spells a path out.
#ifndef VELL_FS_PATHS_H_
#define VELL_FS_PATHS_H_

namespace vell::paths {

// The data directory, written by the updater, and the folder of its downloads.
inline constexpr char data_dir[] = "/var/db/timezone/";
inline constexpr char downloads[] = "/var/db/timezone/tz/";

// The links that the rest of the device reads, and the one vell only reads.
inline constexpr char zoneinfo_link[] = "/var/db/timezone/zoneinfo";
inline constexpr char icutz_link[] = "/var/db/timezone/icutz";
inline constexpr char localtime_link[] = "/var/db/timezone/localtime";
inline constexpr char latest_link[] = "/var/db/timezone/tz_latest";

// Files vell leaves for other software.
inline constexpr char cleanup_marker[] = "/var/db/timezone/needs_cleanup";
inline constexpr char version_diff_record[] = "/var/db/timezone/TZVersionDiffRecord";

// The one directory below which vell writes anything; the kernel holds it to that.
inline constexpr char writable_root[] = "/var/db";

// Places of older releases.
inline constexpr char legacy_icutz_link[] = "/var/db/icutz";
inline constexpr char legacy_icu_dir[] = "/var/db/icu";

// The system partition.
inline constexpr char system_zoneinfo[] = "/usr/share/zoneinfo.default";
inline constexpr char system_icu[] = "/usr/share/icu";
// Where local-time links pointed before the zoneinfo link existed.
inline constexpr char old_zoneinfo[] = "/usr/share/zoneinfo";

inline constexpr char default_zone[] = "America/Los_Angeles";
// Fixed on its own rather than joined, so the reset never depends on anything.
inline constexpr char default_localtime_target[] = "/var/db/timezone/zoneinfo/America/Los_Angeles";

}  // namespace vell::paths

#endif  // VELL_FS_PATHS_H_
