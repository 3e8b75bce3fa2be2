/* SPDX-License-Identifier: Apache-2.0 */
/* plugin.c: what a vendor ships, built once for each. */
const char* plugin_greet(void);

const char* plugin_greet(void) { return "hello from " VENDOR; }
