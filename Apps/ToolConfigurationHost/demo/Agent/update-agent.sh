#!/bin/sh
# Demo update agent. "--check-configuration FILE" checks the online-update settings file:
# exit 0 when it is usable, 2 when it is missing, 3 when it is not a settings file, 5 when the
# mode "OTHER" has no distribution folder. "preparer" (the daily task) notes its run in
# Logs/update-agent.log of the working folder the agent sits in; anything else does nothing.
if [ "$1" = "preparer" ]; then
    logs=$(dirname "$0")/../Logs
    mkdir -p "$logs" && echo "$(date '+%Y-%m-%d %H:%M:%S') preparer ran" >> "$logs/update-agent.log"
    exit 0
fi
if [ "$1" != "--check-configuration" ]; then
    exit 0
fi
settings=$2
[ -n "$settings" ] && [ -r "$settings" ] || exit 2
grep -q '<BSet' "$settings" || exit 3
if grep -q '<String key="DeploymentMode">OTHER</String>' "$settings" &&
   grep -q -E '<String key="DistributionFolderPath"( */>|></String>)' "$settings"; then
    exit 5
fi
exit 0
