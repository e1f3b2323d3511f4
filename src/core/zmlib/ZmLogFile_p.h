/// \file
/// The platform part of the log (private): the console device and the redirection of standard
/// error into the log. ZmLogFile_posix.cpp implements it.
#pragma once

#include <cstdio>

/// Opens the terminal of the process for writing, not inherited by started programs; null when
/// the process has none (a service, CI).
FILE* zmLogOpenConsole();

/// Makes standard error write where standard output now goes (after it was reopened on the log).
void zmLogRedirectStandardError();
