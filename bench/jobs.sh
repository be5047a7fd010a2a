#!/bin/sh
# SPDX-License-Identifier: BSD-2-Clause
# Runs in a machine that systemd has booted without the package. Starts the package's unit and one
# without restrictions in turn, and writes into /figures how long each job takes: from when systemd
# has forked, before which it does the same for both, until it knows of the program's end and lets
# the boot go on.
exec </dev/null >/dev/console 2>&1
set -eu

dpkg --install /mnt/tzreconcile_*.deb >/dev/null
printf '[Service]\nType=oneshot\nRemainAfterExit=yes\nExecStart=tzreconcile\n' \
    >/run/systemd/system/plain.service
systemctl daemon-reload
systemctl start plain # makes the links

time_of() { # EVENT UNIT: in microseconds
    systemctl show --property="$1TimestampMonotonic" --value "$2"
}

for round in $(seq -w 40); do
    for unit in plain tzreconcile; do
        systemctl reset-failed $unit # no start is one too many
        systemctl restart $unit
        took=$(($(time_of ActiveEnter $unit) - $(time_of InactiveExit $unit)))
        printf '{"results": [{"command": "unit %s", "median": %de-6, "min": %de-6}]}' \
            $unit $took $took >"/figures/unit $unit, $round"
    done
done
