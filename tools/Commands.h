// The tool's commands; each takes the arguments after its name and returns the exit status. The list that
// names them, with their help, is in Commands.cpp.
#pragma once

int runInfo(int argc, char** argv);
int runExtract(int argc, char** argv);
int runSample(int argc, char** argv);
int runSelfCheck(int argc, char** argv);
int runToc(int argc, char** argv);
