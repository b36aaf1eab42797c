#!/usr/bin/env bash
# Sends each query of a Grafana dashboard to a Prometheus server, for all machines. Each must return a
# number. Usage: dashboard.sh DASHBOARD ADDRESS
set -euo pipefail

mapfile -t queries < <(jq -r '.templating.list[] | select(.type == "query").query' "$1" |
  sed 's/^label_values(\(.*\), [a-z]*)$/\1/'; jq -r '.panels[].targets[]?.expr' "$1")
for query in "${queries[@]}"; do
  query=${query//\$instance/.*}
  answer=$(promtool query instant "http://$2" "$query" 2>&1) || true
  grep -q '=> [-+.e0-9]* @' <<<"$answer" || { printf '%s\nis not a number but\n%s\n' "$query" "$answer"; exit 1; }
done
[ ${#queries[@]} -gt 1 ]
[ -z "$(jq -c '.panels[] | .id, (.gridPos | {x, y})' "$1" | sort | uniq -d)" ] || { echo "$1: two panels have the same id or place"; exit 1; }
echo "${#queries[@]} queries of the dashboard return data"
