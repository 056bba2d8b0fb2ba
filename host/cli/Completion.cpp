#include "host/cli/Completion.h"

#include <CLI/App.hpp>

namespace marlo::cli {

namespace {

constexpr const char* ScriptHead =
    R"bash(# Completion of marlo's command line for bash: source this file, or put it where bash-completion looks.

_marlo_classes() {
    local command="$1" namespace="root/tavis" i
    for ((i = 1; i < COMP_CWORD; ++i)); do
        case "${COMP_WORDS[i]}" in
        -n | --namespace) namespace="${COMP_WORDS[i + 1]}" ;;
        esac
    done
    "$command" classes --names -n "$namespace" 2>/dev/null
}

_marlo_adapters() {
    local command="$1" tree=() i
    for ((i = 1; i < COMP_CWORD; ++i)); do
        [[ "${COMP_WORDS[i]}" != --tree ]] || tree=(--tree "${COMP_WORDS[i + 1]}")
    done
    "$command" names MARLO_NetworkAdapterConfiguration "${tree[@]}" 2>/dev/null |
        sed -n 's/^.*\.SettingID="\(.*\)"$/\1/p'
}

# The arguments behind the command: how many there are before the word that is being typed, without options.
_marlo_arguments() {
    local i seen=0 count=0
    for ((i = 1; i < COMP_CWORD; ++i)); do
        case "${COMP_WORDS[i]}" in
        "$1") seen=1 ;;
        -n | --namespace | --tree | --agent-config | --schema | --providers | --libraries | --*-level | --*-sink) ((++i)) ;;
        --config | --socket | --http | --https | --filter | --language | --mask | --gateway | --server | --search | --domain | -p | --property) ((++i)) ;;
        -*) ;;
        *) ((count += seen)) ;;
        esac
    done
    echo "$count"
}

_marlo() {
    local current="${COMP_WORDS[COMP_CWORD]}" previous="${COMP_WORDS[COMP_CWORD - 1]}"
    local commands options subcommand="" i
)bash";

constexpr const char* ScriptTail = R"bash(
    case "$previous" in
    --tree | --agent-config | --config | --socket)
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
        return
        ;;
    --schema | --providers | --libraries)
        mapfile -t COMPREPLY < <(compgen -d -- "$current")
        return
        ;;
    --language)
        mapfile -t COMPREPLY < <(compgen -W "WQL CQL" -- "$current")
        return
        ;;
    --log-sink | --trace-sink)
        mapfile -t COMPREPLY < <(compgen -W "stderr syslog file:" -- "$current")
        return
        ;;
    -n | --namespace)
        mapfile -t COMPREPLY < <(compgen -W "root/tavis root/quarn root/interop" -- "$current")
        return
        ;;
    esac
    if [[ -z "$subcommand" ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$commands $options" -- "$current")
        return
    fi
    if [[ "$current" == -* ]]; then
        mapfile -t COMPREPLY < <(compgen -W "$options" -- "$current")
        return
    fi
    case "$subcommand" in
    enum | names | watch)
        mapfile -t COMPREPLY < <(compgen -W "$(_marlo_classes "${COMP_WORDS[0]}")" -- "$current")
        ;;
    subscribe)
        [[ "$(_marlo_arguments subscribe)" == 0 ]] ||
            mapfile -t COMPREPLY < <(compgen -W "$(_marlo_classes "${COMP_WORDS[0]}")" -- "$current")
        ;;
    unsubscribe)
        mapfile -t COMPREPLY < <(compgen -W "$("${COMP_WORDS[0]}" subscriptions 2>/dev/null |
            awk 'NR > 1 && $1 ~ /^marlo/ { print $1 }' | sort -u)" -- "$current")
        ;;
    get)
        mapfile -t COMPREPLY < <(compgen -S . -W "$(_marlo_classes "${COMP_WORDS[0]}")" -- "$current")
        compopt -o nospace
        ;;
    invoke | set | static | dhcp | dns | gateway)
        case "$subcommand $(_marlo_arguments "$subcommand")" in
        *" 0")
            mapfile -t COMPREPLY < <(compgen -W "$(_marlo_adapters "${COMP_WORDS[0]}")" -- "$current")
            ;;
        "invoke 1")
            mapfile -t COMPREPLY < <(compgen -W "EnableDHCP EnableStatic SetGateways SetDNSDomain \
                SetDNSServerSearchOrder SetDNSSuffixSearchOrder RestartNetwork" -- "$current")
            ;;
        "set "*)
            mapfile -t COMPREPLY < <(compgen -S = -W "IPv4Address SubnetMask DefaultIPGateway DNSDomain" -- "$current")
            compopt -o nospace
            ;;
        esac
        ;;
    completion)
        mapfile -t COMPREPLY < <(compgen -W "bash" -- "$current")
        ;;
    esac
}

complete -F _marlo marlo
)bash";

void append(std::string& list, const std::string& word) {
    list += (list.empty() ? "" : " ") + word;
}

/** All spellings of an application's options, `-p` as well as `--property`. */
std::string listOptions(const CLI::App& app) {
    std::string list;
    for (const CLI::Option* option : app.get_options()) {
        for (const std::string& name : option->get_snames()) {
            append(list, "-" + name);
        }
        for (const std::string& name : option->get_lnames()) {
            append(list, "--" + name);
        }
    }
    return list;
}

} // namespace

std::string makeBashCompletion(const CLI::App& app) {
    std::string commands;
    std::string cases;
    for (const CLI::App* subcommand : app.get_subcommands([](const CLI::App*) { return true; })) {
        append(commands, subcommand->get_name());
        cases += "        " + subcommand->get_name() + ") subcommand=\"" + subcommand->get_name() + "\" options=\"" +
                 listOptions(*subcommand) + "\" ;;\n";
    }
    return ScriptHead + ("    commands=\"" + commands + "\"\n    options=\"" + listOptions(app) + "\"\n") +
           "    for ((i = 1; i < COMP_CWORD; ++i)); do\n        [[ -z \"$subcommand\" ]] || break\n"
           "        case \"${COMP_WORDS[i]}\" in\n" +
           cases + "        esac\n    done" + ScriptTail;
}

} // namespace marlo::cli
