# SPDX-License-Identifier: Apache-2.0
# Sourced by the scripts that build and run things: drops every variable of the caller's but those named here, so that a
# proxy, adapters or compiler flags that somebody exported change nothing. No script touches the machine's own adapters.
_quenx_keep=" PATH HOME USER LOGNAME SHELL TERM NO_COLOR TMPDIR PWD SHLVL _ CI JOBS FUZZ_SECONDS DEBIAN_MIRROR \
ASAN_OPTIONS LSAN_OPTIONS TSAN_OPTIONS UBSAN_OPTIONS "
for _quenx_name in $(compgen -e); do
    case "$_quenx_name" in CCACHE_*) continue ;; esac
    case "$_quenx_keep" in *" $_quenx_name "*) ;; *) unset "$_quenx_name" ;; esac
done
unset _quenx_keep _quenx_name
# Nobody is kept from shutting a machine down by simulated adapters.
export LC_ALL=C.UTF-8 QUENX_BACKEND=simulator DBUS_SYSTEM_BUS_ADDRESS=unix:path=/nonexistent
