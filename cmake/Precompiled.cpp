// SPDX-License-Identifier: Apache-2.0
// The source of the targets that only precompile headers.
