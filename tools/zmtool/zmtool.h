// The command families of zmtool. Each takes the arguments after its own name and returns the
// process exit status.
#pragma once

namespace zmtool {

int runDemo(int argc, char** argv);
int runMd5(int argc, char** argv);
int runCksum(int argc, char** argv);
int runUuid(int argc, char** argv);
int runOrient(int argc, char** argv);
int runRaw(int argc, char** argv);
int runBundle(int argc, char** argv);

} // namespace zmtool
