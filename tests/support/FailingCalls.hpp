#pragma once

// Lets one call to the system fail: loaded before the C library (LD_PRELOAD)
// or linked before it, this stands between a program and the system.
//
// Calls are counted by kind, which is the function's name, and only if they
// concern a file in one folder or the folder itself:
//
//   open close read write pwrite fsync rename mmap fstat stat lstat flock
//   fchmod readdir
//
// Of the kind pthread_create, all calls count.
//
// In a process of its own, the environment says what fails; the file FAIL_MARK
// is made when it did:
//
//   FAIL_FOLDER=/folder FAIL_CALL="pwrite 3 28" FAIL_MARK=/elsewhere/mark

extern "C" {

// From now on, the call of this kind and number, counted from 1, fails with
// this error; a `close` closes nevertheless. Error 0: `read`, `write` and
// `pwrite` do a half of what is asked for, all others fail. Number 0: none.
void failCall(const char* folder, const char* kind, long number, int error);

// Whether that call was made.
int hasFailed();
}
