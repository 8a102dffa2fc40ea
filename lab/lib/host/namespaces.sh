# shellcheck shell=bash disable=SC2154 # variables that the lab's files share
# Starting an appliance in namespaces of this machine's own kernel.

# lab_make_namespaces_tree FOLDER TOPOLOGY CASE-FOLDER: what an appliance has besides the layers.
lab_make_namespaces_tree()
{
    mkdir -p "$1"
    lab_fill_guest "$1" namespaces "$2" "$3" ''
}

# lab_start_namespaces SECONDS TREE WORDS RESULTS: replaces the calling process by the appliance,
# which is ended after that many seconds (0: never). Its output is the report.
lab_start_namespaces()
{
    local seconds=$1 tree=$2 words=$3 results=$4 around=()
    # Who is not root here is there.
    if [[ $(id -u) -ne 0 ]]; then
        around=(--user --map-root-user)
    fi
    mkdir -p "$tree.root"
    : >"$results"
    exec timeout --foreground -k 5 "$seconds" unshare "${around[@]}" --mount --net --pid --ipc --uts \
        --fork --kill-child "$lab_source/lib/namespaces/enter" "$tree.root" "$lab_layers" "$tree" \
        "$words" "$results"
}
