// SPDX-License-Identifier: Apache-2.0
int main() {}
