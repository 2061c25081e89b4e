// The tool's sub-commands; each takes the arguments after its name and returns the exit status.
#pragma once

int runSelfCheck(int argc, char** argv);
int runInfo(int argc, char** argv);
int runSample(int argc, char** argv);
int runExtract(int argc, char** argv);
int runToc(int argc, char** argv);
