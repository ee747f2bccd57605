#!/bin/sh
# What one would write without thinking of time: looks up four settings of the installation, makes
# the workspace, and starts the platform.
home=$(cd "$(dirname "$0")/.." && pwd)

setting() {
    grep "^$1=" "$home/rcp/velmora.properties" | cut -d= -f2-
}

id=$(setting rcp.install.id)
base=$(setting rcp.base.location)
configuration=$(setting install.configuration)
vm=$(setting jvm.location)
workspace=$HOME/VANTOR/RCP/$id/$USER
mkdir -p "$workspace"
"$home${base#*\}}/linux/x86/eclipse" -data "$workspace" -configuration "$workspace/.config" \
    -vm "$home${vm#*\}}" -vmargs "-Drcp.home=$home" "-Drcp.install.config=$configuration" &
