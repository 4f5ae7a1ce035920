#!/usr/bin/env bash
# Builds the provider and the command-line tool, then shows the bundled sample server's blue
# lights as a WBEM client would see them: all four classes and a walk across both associations.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/ensure-packages.sh demo

# Its own build folder without the tests, so that the demo builds only what it runs.
build_dir="${BUILD_DIR:-build-demo}"
cmake -S . -B "$build_dir" -DCMAKE_BUILD_TYPE="${BUILD_TYPE:-RelWithDebInfo}" \
  -DBLUELIGHT_BUILD_TESTS=OFF -DBLUELIGHT_BUILD_BENCHMARKS=OFF >/dev/null
cmake --build "$build_dir" -j "${JOBS:-$(nproc 2>/dev/null || echo 2)}" \
  --target bluelightprofileprovider bluelight-cli >/dev/null

export KESTA_INSTRUMENTATION="file:$PWD/examples/sample-tree.json"
export KESTA_SYSTEM_NAME="${KESTA_SYSTEM_NAME:-demo-host}"
export VNLOG_SINK="${VNLOG_SINK:-none}"
cli="$build_dir/bin/bluelight-cli"

light='root/cimv2:KESTA_BlueLight.CreationClassName="KESTA_BlueLight",DeviceID="Blue Light:1.2",SystemCreationClassName="KESTA_ComputerSystem",SystemName="'"$KESTA_SYSTEM_NAME"'"'
system='root/cimv2:KESTA_ComputerSystem.CreationClassName="KESTA_ComputerSystem",Name="'"$KESTA_SYSTEM_NAME"'"'

step() {
  printf '\n$ bluelight-cli %s\n' "$*"
  "$cli" "$@"
}

step ein KESTA_BlueLight
step ei --properties ElementName,HealthState,OperationalStatus,AlarmState KESTA_BlueLight
step gi "$light"
step ei KESTA_BlueLightCapabilities
step ein KESTA_BlueLightElementCapabilities
step ain --assoc-class KESTA_BlueLightElementCapabilities "$light"
step ri --assoc-class KESTA_BlueLightElementCapabilities "$light"
step ein KESTA_BlueLightSystemDevice
step ain --assoc-class KESTA_BlueLightSystemDevice "$system"
step ain --assoc-class KESTA_BlueLightSystemDevice "$light"
