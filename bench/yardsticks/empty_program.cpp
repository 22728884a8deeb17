// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Does nothing, with the libraries that morvend is linked with.
int main() { return 0; }
