#include "commands.h"

#include <map>

namespace zelserverd {

std::optional<std::string> CommandContext::required(std::string_view name,
                                                    Reply& failure) const {
  const std::string* value = request.find(name);
  if (!value || value->empty()) {
    failure = Reply::error("missing value \"" + std::string(name) + "\"");
    return std::nullopt;
  }
  return *value;
}

namespace {

std::map<std::string_view, CommandSpec> buildTable() {
  std::map<std::string_view, CommandSpec> table;
  for (auto family : {sessionCommands, securityCommands, sharedResourceCommands, jobCommands,
                      repositoryCommands})
    for (const CommandSpec& spec : family()) table.emplace(spec.keyword, spec);
  return table;
}

}  // namespace

const CommandSpec* findCommand(std::string_view keyword) {
  static const std::map<std::string_view, CommandSpec> table = buildTable();
  auto it = table.find(keyword);
  return it == table.end() ? nullptr : &it->second;
}

Reply dispatch(CommandContext& context) {
  const CommandSpec* spec = findCommand(context.request.keyword);
  if (!spec) return Reply::error("unknown command \"" + context.request.keyword + "\"");
  if (spec->needsSignIn) {
    if (!context.session.principal)
      return Reply::authentication("sign in with SERVER_SESSION_INIT first");
    if ((context.principal().rights & spec->right) != spec->right)
      return Reply::authorization("user '" + context.principal().user +
                                  "' may not run " + std::string(spec->keyword));
  }
  return spec->handler(context);
}

}  // namespace zelserverd
