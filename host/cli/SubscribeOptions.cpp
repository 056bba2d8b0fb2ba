#include "host/cli/OptionParts.h"

namespace marlo::cli {

namespace {

constexpr const char* SubscribeExamples =
    R"(The running server sends indications to the listener at URL, http or https, until somebody unsubscribes:
in order, and over restarts of either side. Exit status: 0 subscribed, also where it was so before, 1 the
server refuses or does not run, 2 the command line is wrong.

Examples:
  marlo subscribe http://192.0.2.7:5990/indications
  marlo subscribe https://manager.example:5991/ MARLO_NetworkAdapterOfflineEvent
  marlo subscribe http://192.0.2.7:5990/ --filter "SELECT * FROM CIM_AlertIndication WHERE PerceivedSeverity >= 3")";

constexpr const char* ListExamples = R"(Examples:
  marlo subscriptions
  marlo subscriptions --json)";

constexpr const char* UnsubscribeExamples =
    R"(NAME is a listener's name, its URL, or a filter's name, as `marlo subscriptions` shows them. Listeners and
filters that `marlo subscribe` made go with their last subscription, and so does what waits for them.

Examples:
  marlo unsubscribe marlo:listener-1
  marlo unsubscribe http://192.0.2.7:5990/indications
  marlo unsubscribe --all)";

void addServer(CLI::App& app, Options& options) {
    addConfiguration(app, options.server);
    addSocket(app, options.server, "Ask the server there");
}

} // namespace

void addSubscriptionCommands(CLI::App& app, Options& options) {
    CLI::App& subscribe = addCommand(app, options, Command::Subscribe, "subscribe",
                                     "Have the server send indications to a listener", SubscribeExamples);
    addPositional(subscribe, "URL", options.argument, "The listener");
    subscribe
        .add_option("CLASS", options.watch.classes,
                    "Classes of indications, with their subclasses; where none is named, those of the adapters")
        ->type_name("");
    subscribe
        .add_option("--filter", options.watch.filter, "What this SELECT statement chooses, in the place of classes")
        ->type_name("TEXT");
    subscribe.add_option("--language", options.watch.language, "The filter's language: WQL or CQL")
        ->type_name("NAME")
        ->capture_default_str();
    subscribe.add_flag("--json", options.json, "Print JSON: an array with an object for each subscription");
    addNameSpace(subscribe, options);
    addServer(subscribe, options);

    CLI::App& list = addCommand(app, options, Command::Subscriptions, "subscriptions",
                                "Show who is sent which indications", ListExamples);
    list.add_flag("--json", options.json, "Print JSON: an array with an object for each subscription");
    addServer(list, options);

    CLI::App& unsubscribe = addCommand(app, options, Command::Unsubscribe, "unsubscribe",
                                       "Have the server send indications no more", UnsubscribeExamples);
    CLI::Option* name = unsubscribe.add_option("NAME", options.argument, "The listener or the filter")->type_name("");
    unsubscribe.add_flag("--all", options.all, "All subscriptions, whoever made them")->excludes(name);
    unsubscribe.add_flag("--json", options.json, "Print JSON: an array with an object for each that has ended");
    addServer(unsubscribe, options);
}

} // namespace marlo::cli
