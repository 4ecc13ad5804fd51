# A private X server with a small window manager, a private session bus and a private runtime directory, and ways to
# see and touch what is on it. Sourced by ./run and the end-to-end tests.

# start_display WIDTHxHEIGHT: sets DISPLAY, DBUS_SESSION_BUS_ADDRESS and XDG_RUNTIME_DIR. $KX_WINDOW_MANAGER may be the
# command of another window manager, which has settings of its own here.
start_display() {
    display_dir=$(mktemp -d)
    display_pids=()
    mkdir -m 700 "$display_dir/runtime"
    Xvfb -displayfd 3 -screen 0 "$1x24" -nolisten tcp -noreset \
        3>"$display_dir/number" >"$display_dir/xvfb.log" 2>&1 &
    display_pids+=($!)
    wait_until 20 test -s "$display_dir/number" || { cat "$display_dir/xvfb.log"; return 1; }
    export DISPLAY=:$(cat "$display_dir/number") XDG_RUNTIME_DIR=$display_dir/runtime
    unset WAYLAND_DISPLAY
    export DBUS_SESSION_BUS_ADDRESS=unix:path=$XDG_RUNTIME_DIR/bus
    dbus-daemon --session --nofork --nopidfile --address="$DBUS_SESSION_BUS_ADDRESS" >/dev/null 2>&1 &
    display_pids+=($!)
    XDG_CONFIG_HOME=$display_dir/config ${KX_WINDOW_MANAGER:-openbox --sm-disable} >/dev/null 2>&1 &
    display_manager=$!
    disown
    wait_until 60 window_manager_runs
    display -window root -size "$1" gradient:'#5f86a6-#1d2c3a' || true # answers 1 when it has drawn, too
}

stop_display() {
    local pid
    kill -KILL "${display_manager:-}" 2>/dev/null || true # some do not end when the server does, or when they are asked
    for pid in $(jobs -p) "${display_pids[@]}"; do kill "$pid" 2>/dev/null || true; done
    wait 2>/dev/null || true
    rm -rf "$display_dir"
}

# wait_until SECONDS COMMAND…: polls; fails when the time is over.
wait_until() {
    local deadline=$((SECONDS + $1))
    shift
    until "$@" >/dev/null 2>&1; do
        [ $SECONDS -lt $deadline ] || return 1
        sleep 0.05
    done
}

window_manager_runs() { xprop -root _NET_SUPPORTING_WM_CHECK | grep -q 'window id'; }

# The windows of the agent, told by their names.
find_window() { xdotool search --onlyvisible --name "^$1\$" | head -n 1 | grep .; }

# click_in NAME X Y: X from the left of the window of that name (negative: from its right), Y from its top.
click_in() {
    local X Y WIDTH
    eval "$(xdotool getwindowgeometry --shell "$(find_window "$1")" | grep -E '^(X|Y|WIDTH)=')"
    xdotool mousemove $((X + ($2 < 0 ? WIDTH + $2 : $2))) $((Y + $3)) click 1
}

screenshot() { import -window root "$1"; }

# Two pictures a quarter of a second apart are the same.
screen_is_settled() {
    local before after
    before=$(import -window root rgb:- | sha1sum)
    sleep 0.25
    after=$(import -window root rgb:- | sha1sum)
    [ "$before" = "$after" ]
}
