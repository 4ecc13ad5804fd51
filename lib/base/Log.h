#pragma once

#include <string>

/// The program's log: one plain-text file in ~/Library/Logs/Corvane Tessel, entries appended whole.
/// Any thread may log: an entry is a single write on a descriptor opened for appending, so entries never mix.
/// An entry that cannot be written is dropped in silence.

/// Writes one entry: the date ("Nov  5 14:03:22.120: ") and the printf-style text. No newline is added.
void Log(const char* format, ...) __attribute__((format(printf, 1, 2)));

/// The same, for failures of the raster scaler and of sending.
void Warning(const char* format, ...) __attribute__((format(printf, 1, 2)));

/// The base name of the log files. Set once in `main`, before the first entry.
void SetLogBaseName(std::string name);

/// Index 0 or less is the current file, N > 0 the one with suffix N - 1. Computed afresh from $HOME.
std::string LogFilePath(int index);

/// Shifts the kept files by one; at most four remain. Once per start, before the first entry.
void RotateLogFiles();

/// The same, but only when the current file has become large: for programs that start often and log little.
void RotateLargeLogFile();
