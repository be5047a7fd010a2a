# SPDX-License-Identifier: BSD-2-Clause
# shellcheck shell=sh
# The same for the shells of logins.
export ICU_TIMEZONE_FILES_DIR=/var/db/timezone/icutz
