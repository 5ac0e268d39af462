// SPDX-License-Identifier: MIT
/* A bare C host, with which the cost of vsttorture is compared: it makes the same requests of a plug-in, with
 * the same buffers and the same lines of output, and does nothing else. It has no C++ runtime, no lock around
 * values and no crash guard, and it keeps no description.
 *
 *   bare_host LINES PLUGIN [CHILD_ID]
 *
 * LINES is a file with the output of an earlier run of vsttorture on the same plug-in: the fifty tests of its
 * random pass are run again, so that the two runs are of the same length. */
#include <stdio.h>
#include <stdlib.h>

#include "instance.h"
#include "run.h"

enum { kOrderedTests = 12, kRandomTests = 50, kFirstRandomStep = 16 };

static int step = 0;

static void printStep(const char* text) {
  printf("%d, %s\n", ++step, text);
  fflush(stdout);
}

static void printTotal(int total) {
  printf("total, %d\n", total);
  fflush(stdout);
}

static void describeInStep(AEffect* effect) {
  printStep("test gathering info");
  describeInstance(effect);
}

static void runInStep(AEffect* effect, int number) {
  printStep(testTexts[number]);
  runTest(effect, number);
}

static int testNamed(const char* text) {
  for (int number = 0; number < kTests; ++number) {
    if (strcmp(text, testTexts[number]) == 0) return number;
  }
  return -1;
}

/* Ends the process unless `path` names all fifty tests. */
static void readRandomTests(const char* path, int tests[kRandomTests]) {
  FILE* file = fopen(path, "r");
  int found = 0;
  char line[128];
  while (file != NULL && found < kRandomTests && fgets(line, sizeof line, file) != NULL) {
    int number = 0;
    char text[64];
    if (sscanf(line, "%d, %63[^\n]", &number, text) != 2 || number != kFirstRandomStep + found) continue;
    tests[found] = testNamed(text);
    if (tests[found] < 0) break;
    ++found;
  }
  if (file != NULL) fclose(file);
  if (found == kRandomTests) return;
  fprintf(stderr, "bare_host: %s is not the output of a run that passed\n", path);
  exit(2);
}

static void run(EntryPoint* entry, int32_t child, AEffect** effect, const char* linesPath) {
  static const int kOrder[kOrderedTests] = {0, 1, 2, 3, 4, 5, 5, 4, 3, 2, 1, 0};
  int tests[kRandomTests];
  readRandomTests(linesPath, tests);
  printTotal(64);
  describeInStep(*effect);
  for (int i = 0; i < kOrderedTests; ++i) runInStep(*effect, kOrder[i]);
  printStep("initialize");
  AEffect* old = *effect;
  *effect = createInstance(entry, child);
  ask(old, effClose);
  describeInStep(*effect);
  for (int i = 0; i < kRandomTests; ++i) runInStep(*effect, tests[i]);
}

int main(int argc, char** argv) {
  if (argc < 3) {
    fprintf(stderr, "usage: bare_host LINES PLUGIN [CHILD_ID]\n");
    return 2;
  }
  const int32_t child = argc > 3 ? (int32_t)strtol(argv[3], NULL, 10) : 0;
  EntryPoint* entry = loadEntry(argv[2]);
  AEffect* effect = createInstance(entry, child);
  const int isShell = (int32_t)ask(effect, effGetPlugCategory) == kShellCategory;
  if (isShell) {
    printTotal(51);
    describeInStep(effect);
  } else {
    run(entry, child, &effect, argv[1]);
  }
  ask(effect, effClose);
  return isShell ? 1 : 0;
}
