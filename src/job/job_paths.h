// Completing the paths a job file names. Job files written on Windows must work here too:
// '\' counts as a folder separator as well as '/', a drive path ("C:\...") and an absolute
// POSIX path ("/...") stay as they are, and everything else is taken against a folder.
#pragma once

#include <string>

namespace vox {

// The folder of a job path, with its separator: up to and including the last '\' or '/';
// "./" when there is none.
std::string JobFolderOf(const std::string& job_path);

// Result, raw and NMEA paths, against the job folder (which ends with its separator):
// empty stays empty; "\\server..." and "/..." stay; "\..." gets the folder's drive when it
// has one; "X:\..." stays; anything else is appended to the folder.
std::string ResolveJobPath(const std::string& path, const std::string& job_folder);

// Engine and raw filter libraries: a path holding a separator stays; a bare file name is
// taken in the folder of module_path (this library's own file), or in "./" when that has no
// folder.
std::string ResolveModulePath(const std::string& path, const std::string& module_path);

// When something exists at result_path, the first free "name_N.ext" for N = 0..999 (the
// number goes before the file name's last '.', or at its end), with "(N)" appended to
// job_name. Unchanged when all are taken.
void AutoIncrementResultPath(std::string& result_path, std::string& job_name);

}  // namespace vox
