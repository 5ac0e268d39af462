// SPDX-License-Identifier: MIT
// A module that calls a function which exists nowhere. It must fail to load, not die when it makes the call.
extern "C" {
int thisFunctionExistsNowhere();
int callsIt();
}

int callsIt() { return thisFunctionExistsNowhere(); }
