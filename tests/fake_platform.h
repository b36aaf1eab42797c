// A platform for tests: it plays a script, keeps a journal of every call and counts handles.
#ifndef TESTS_FAKE_PLATFORM_H
#define TESTS_FAKE_PLATFORM_H

#include <functional>
#include <map>
#include <string>
#include <vector>

// Words by key. "present": the driver classes that are registered; "failing": the calls that fail,
// as "name#n" or, counting all calls, "#n" (the names are match, lookup, open, close, release and
// call), and "handle0" for an open that succeeds without a handle, "leftover" for opens that leave
// something where they fail; "failure": their code, unless it is negative; "replies" and "defers":
// what controller and scheduler answer in turn, 0 and no when the words have run out; "commands":
// what each call leaves in the task-scheduler pair; "state": the activity's, unless it is to run;
// "keeps state": it cannot be set.
using Script = std::map<std::string, std::string>;

// Runs the body on a fresh platform with this script. Returns what it printed, if anything, with a
// line end after it, then its calls, one a line. The test fails when the body left a handle open
// or gave back one that was not open.
std::string Play(const Script &script, const std::function<void()> &body);

// Plays the cases of a file under tests/cases and compares each outcome with the expected one. A
// line "== name" begins a case, "key: value" lines are its script, and after a line "->" comes the
// outcome. The body may read keys of its own from the script.
void PlayCases(const std::string &file, const std::function<void(Script &)> &body);

// Plays once for each call that fails alone, and for each two that fail. Returns all outcomes.
std::vector<std::string> PlayEveryFailure(Script script, const std::function<void()> &body);

#endif
