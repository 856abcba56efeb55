// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

// Nothing: headers are precompiled for a program, and whoever is compiled like it shares them.
int main() {}
