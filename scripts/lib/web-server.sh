# shellcheck shell=bash
# shellcheck disable=SC2154  # works on the variables of its caller
# The parts of scripts/web-server. They work on its variables: root, run_dir,
# webapi_dir, data_dir, tls_file, service_program, warm_program, server, mode, port,
# bind, server_pid, wrapper_pid, warm_pid.
# Needs common.sh.

# A UNIX socket's path is short; the web server appends a process id to it.
max_socket_path=90

# The status of curl for a certificate that is not trusted, or is not for the address.
curl_refuses_certificate=60

# Checks server, port and bind, and sets host (what a client writes in a URL),
# listen (what the configuration says), address (host and port) and url.
check_address() {
    case $server in
        lighttpd | nginx | apache) ;;
        *) usage_error "no web server '$server': lighttpd, nginx or apache" ;;
    esac
    case $mode in
        warm | cgi) ;;
        *) usage_error "no mode '$mode': warm or cgi" ;;
    esac
    [[ $port =~ ^[1-9][0-9]{0,4}$ && $port -le 65535 ]] || usage_error "'$port' is no port"
    [[ $bind =~ ^[0-9a-zA-Z.:-]+$ ]] || usage_error "'$bind' is no address"
    host=$bind listen=$bind
    [[ $bind == 0.0.0.0 ]] && host=127.0.0.1
    [[ $bind == :: ]] && host=::1
    local client=$host
    [[ $host == *:* ]] && host="[$host]"
    [[ $listen == *:* ]] && listen="[$listen]"
    address=$host:$port
    url=http${tls_file:+s}://$address
    if (exec 3<>"/dev/tcp/$client/$port") 2>/dev/null; then
        die "port $port of $bind is taken: choose another one with --port"
    fi
}

check_tls_file() {
    [[ -r $tls_file ]] || die "cannot read '$tls_file'"
    tls_file=$(realpath -- "$tls_file")
    local block
    for block in 'PRIVATE KEY' CERTIFICATE; do
        grep -qsE -- "^-----BEGIN (EC |RSA )?$block-----" "$tls_file" ||
            die "no ${block,,} in $tls_file"
    done
}

# The paths end up between double quotes in configurations.
prepare_run_dir() {
    local path
    for path in "$root" "$run_dir" "$data_dir" "$tls_file"; do
        [[ $path =~ [[:cntrl:]\"\'\$\\%] ]] && die "a web server cannot work in '$path'"
    done
    if [[ -e $run_dir && ! -e $run_dir/.web-server ]] && [[ -n $(ls -A "$run_dir") ]]; then
        die "$run_dir is not empty and not a web server's"
    fi
    if [[ -s $run_dir/server.pid ]] && kill -0 "$(cat "$run_dir/server.pid")" 2>/dev/null; then
        die "a web server works in $run_dir already"
    fi
    rm -rf "$run_dir"
    mkdir -p "$run_dir/tmp" "$run_dir/htdocs"
    : >"$run_dir/.web-server"
    cp "$project/packaging/web-servers/index.html" "$run_dir/htdocs/"
    socket_dir=$run_dir
    if [[ ${#run_dir} -gt $((max_socket_path - 16)) ]]; then
        socket_dir=$(mktemp -d)
    fi
}

# fill_in TEMPLATE FILE: nginx and lighttpd work as whoever started them; nginx has to
# be told so.
fill_in() {
    local text user_line='' socket=$socket_dir/fcgi.sock
    [[ $EUID -eq 0 ]] && user_line="user root;"
    [[ $mode == warm ]] && socket=$socket_dir/webapi.sock
    text=$(<"$project/packaging/web-servers/$1")
    text=${text//"#$mode# "/}
    [[ -z $data_dir ]] || text=${text//'#send-files# '/}
    if [[ -n $tls_file ]]; then
        text=${text//'#tls# '/}
    else
        text=${text//'#plain# '/}
    fi
    text=${text//@TLS_FILE@/"$tls_file"}
    text=${text//@DATA_DIR@/"$data_dir"}
    text=${text//@RUN_DIR@/"$run_dir"}
    text=${text//@SOCKET_DIR@/"$socket_dir"}
    text=${text//@SOCKET@/"$socket"}
    text=${text//@WEBAPI_DIR@/"$webapi_dir"}
    text=${text//@LISTEN@/"$listen"}
    text=${text//@PORT@/"$port"}
    text=${text//@USER_LINE@/"$user_line"}
    printf '%s\n' "$text" >"$run_dir/$2"
}

# A server's own part, and what it shall do for the web API.
write_configuration() {
    fill_in "$server.conf.in" "$server.conf"
    fill_in "$server-$mode.conf.in" entry.conf
    [[ $server != nginx ]] || fill_in nginx-streamed.conf streamed.conf
}

# What the platform calls when a response asks for a restart of the web server.
# Each server's graceful signal: running requests end undisturbed.
write_service_program() {
    local signal=USR1
    [[ $server == nginx ]] && signal=HUP
    mkdir -p "$(dirname "$service_program")"
    cat >"$service_program.new" <<END
#!/bin/sh -e
# Written by scripts/web-server, for the web server of $run_dir.
[ "\$1 \$2" = "httpd restart" ] || exit 1
kill -s $signal "\$(cat '$run_dir/server.pid')"
END
    chmod 755 "$service_program.new"
    mv "$service_program.new" "$service_program"
}

# The server ends with this script, however this one ends.
launch() {
    setpriv --pdeathsig TERM "$@" >>"$run_dir/output.log" 2>&1 </dev/null &
    server_pid=$!
    echo "$server_pid" >"$run_dir/server.pid"
}

# await_socket PID SOCKET: the process listens, or the script ends.
await_socket() {
    local try
    for try in {1..100}; do
        [[ -S $2 ]] && return
        kill -0 "$1" 2>/dev/null || break
        sleep 0.05
    done
    show_log
    die "nobody listens on $2 ($try tries)"
}

# As many processes as requests are served at once; a slow client holds one.
start_wrapper() {
    (cd "$run_dir" && exec setsid setpriv --pdeathsig TERM \
        fcgiwrap -c 32 -s "unix:$socket_dir/fcgi.sock") >>"$run_dir/wrapper.log" 2>&1 </dev/null &
    wrapper_pid=$!
    await_socket "$wrapper_pid" "$socket_dir/fcgi.sock"
}

# start_warm_server [PRIVILEGES]: options of setpriv. In a session of its own: an
# interrupt from the terminal reaches the web server first, and this one by the script.
start_warm_server() {
    (cd "$run_dir" && exec setsid setpriv --pdeathsig TERM "$@" \
        "$warm_program" --socket "$socket_dir/webapi.sock") >>"$run_dir/warm.log" 2>&1 </dev/null &
    warm_pid=$!
    await_socket "$warm_pid" "$socket_dir/webapi.sock"
}

# Apache refuses to serve as root. It works as nobody, who may read what root
# may: a checkout often lies in a folder that is closed to others.
start_server() {
    local PATH=$PATH:/usr/sbin:/sbin privileges=()
    if [[ $server == apache && $EUID -eq 0 ]]; then
        privileges=(--reuid=65534 --regid=65534 --clear-groups
            --inh-caps=+dac_override --ambient-caps=+dac_override)
    fi
    [[ $mode == cgi ]] || start_warm_server "${privileges[@]}"
    case $server in
        lighttpd) launch lighttpd -D -f "$run_dir/lighttpd.conf" ;;
        nginx)
            [[ $mode == warm ]] || start_wrapper
            launch nginx -p "$run_dir" -c "$run_dir/nginx.conf" -e "$run_dir/error.log"
            ;;
        apache) launch "${privileges[@]}" apache2 -D FOREGROUND -f "$run_dir/apache.conf" ;;
    esac
}

await_ready() {
    local try status trust=()
    [[ -z $tls_file ]] || trust=(--cacert "$tls_file")
    for try in {1..200}; do
        status=0
        curl -q --noproxy '*' -gfsS "${trust[@]}" -o "$run_dir/tmp/index" "$url/" \
            2>"$run_dir/tmp/problem" || status=$?
        kill -0 "$server_pid" 2>/dev/null || break
        if [[ $status -eq 0 ]]; then
            rm -f "$run_dir"/tmp/{index,problem}
            return
        fi
        [[ $status -ne $curl_refuses_certificate ]] || break
        sleep 0.05
    done
    show_log
    die "$server does not answer on $address ($try tries)$(sed 's/^/: /;q' "$run_dir/tmp/problem")"
}

show_log() {
    tail -n 20 -- "$run_dir"/*.log >&2 || true
}

show_examples() {
    local entry="$url/webapi/entry.cgi" curl=curl trusted=${tls_file%.pem}.crt
    [[ -e $trusted ]] || trusted=$tls_file
    [[ -z $tls_file ]] || printf -v curl 'curl --cacert %q' "$trusted"
    cat <<END

Try, in another terminal:
  $curl '$entry?api=TALO.System&version=1&method=ping&text=hi'
  $curl -c jar -d 'api=TALO.Session&version=1&method=open&account=admin' \\
      --data-urlencode 'passwd="PASSWORD"' $entry
  $curl -b jar -d '{"api":"TALO.System","version":2,"method":"info"}' $entry
END
    grep -qsF '"name": "public"' "$root/etc/talo/shares" || return 0
    cat <<END
  $curl -b jar -F file=@README.md '$entry?api=TALO.File&version=1&method=upload&path=/public'
  $curl -b jar -d 'api=TALO.File&version=1&method=list&folder=/public' $entry
  $curl -b jar -o copy.md '$entry?api=TALO.File&version=1&method=download&path=/public/README.md'
  $curl -b jar -d 'api=TALO.File.Checksum&version=1&method=start&path=/public' $entry
  $curl -b jar -d 'api=TALO.Task&version=1&method=status&task_id=TASK_ID' $entry
END
}

# stop_process PID [GROUP]: asks, waits five seconds, insists.
stop_process() {
    local target=$1 try
    [[ -n $1 ]] || return 0
    [[ ${2-} == group ]] && target=-$1
    kill -TERM -- "$target" 2>/dev/null || return 0
    for try in {1..100}; do
        kill -0 "$1" 2>/dev/null || break
        [[ $try -lt 100 ]] || kill -KILL -- "$target" 2>/dev/null || true
        sleep 0.05
    done
    wait "$1" 2>/dev/null || true
}

stop_all() {
    trap '' INT TERM HUP
    stop_process "$server_pid"
    stop_process "$wrapper_pid" group
    # It ends its workers; the tasks in its group go on.
    stop_process "$warm_pid"
    rm -f "$run_dir/server.pid"
    if grep -qsF -- "for the web server of $run_dir." "$service_program"; then
        rm -f "$service_program"
    fi
    [[ ${socket_dir-$run_dir} == "$run_dir" ]] || rm -rf "$socket_dir"
}
