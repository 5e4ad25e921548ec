#include "device/screen/HomeScreen.h"

#include <array>
#include <unordered_set>
#include <utility>

#include "base/ReturnIfError.h"
#include "device/packages/BundleIdentifier.h"
#include "device/storage/Database.h"
#include "plist/PropertyList.h"

namespace appsync::device {

namespace {

constexpr std::string_view kIconLists = "iconLists";
constexpr std::uint32_t kIdentifierArray = 1;

/// The outcome of each `AssertionAnswer`, in their order. 3 is an unnamed outcome, which means a failure.
constexpr std::array<platform::TerminationAssertionOutcome, 4> kOutcomes{
    platform::TerminationAssertionOutcome::granted,
    platform::TerminationAssertionOutcome::denied,
    platform::TerminationAssertionOutcome::notFound,
    platform::TerminationAssertionOutcome{3},
};

class HeldApp final : public platform::TerminationAssertion {};

/// Unique identifiers in insertion order.
class IconOrder {
 public:
  void append(std::string_view identifier) {
    if (placed_.emplace(identifier).second) order_.emplace_back(identifier);
  }
  [[nodiscard]] std::vector<std::string> take() { return std::exchange(order_, {}); }

 private:
  std::vector<std::string> order_;
  std::unordered_set<std::string> placed_;
};

/// Adds the icons of a layout. The maximum depth of property lists bounds the recursion.
void appendIcons(IconOrder& icons, const plist::Value& layout) {
  if (const auto identifier = layout.string()) {
    if (isBundleIdentifier(*identifier)) icons.append(*identifier);
  } else if (const plist::Array* elements = layout.array()) {
    for (const plist::Value& element : *elements)
      appendIcons(icons, element);
  } else if (const plist::Value* lists = layout.find(kIconLists); lists != nullptr && lists->array() != nullptr) {
    appendIcons(icons, *lists);
  }
}

Status appendLayout(Database& database, IconOrder& icons) {
  Database::Session session(database);
  Statement rows = session.prepare("select identifier from icon_layout order by position");
  while (rows.next())
    icons.append(rows.text(0));
  return rows.status();
}

void appendApps(platform::AppRegistry& registry, IconOrder& icons) {
  registry.enumerateBundlesOfType(platform::BundleKind::all, [&](const platform::BundleRecord& bundle, bool&) {
    if (bundle.asAppRecord() != nullptr) icons.append(bundle.applicationIdentifier());
  });
}

}  // namespace

void HomeScreen::setIconState(Port, ByteView layout) {
  const auto root = plist::read(layout);
  if (!root || root->string()) return;
  IconOrder icons;
  appendIcons(icons, *root);
  const std::vector<std::string> order = icons.take();
  if (order.empty()) return;
  Database::Transaction transaction(database_);
  transaction.run("delete from icon_layout").ignore();
  for (std::int64_t position = 1; const std::string& identifier : order) {
    transaction.run("insert into icon_layout values (?, ?)", position++, identifier).ignore();
  }
  transaction.commit().ignore();
}

std::optional<Bytes> HomeScreen::getFlattenedIconState(Port, std::uint32_t format) {
  if (format != kIdentifierArray) return std::nullopt;
  const auto order = iconOrder();
  if (!order) return std::nullopt;
  auto document = plist::writeBinary(plist::Array(order->begin(), order->end()));
  if (!document) return std::nullopt;
  return std::move(document).value();
}

std::unique_ptr<platform::TerminationAssertion> HomeScreen::terminationAssertionCreate(
    std::string_view bundleIdentifier, std::uint32_t, platform::TerminationAssertionOutcome& outcome) {
  auto answer = settings_.assertionAnswer(bundleIdentifier);
  if (!answer) {
    answer = registry_.applicationIsInstalled(bundleIdentifier) ? AssertionAnswer::granted : AssertionAnswer::unknown;
  }
  outcome = kOutcomes[static_cast<std::size_t>(*answer)];
  return answer == AssertionAnswer::granted ? std::make_unique<HeldApp>() : nullptr;
}

Result<std::vector<std::string>> HomeScreen::iconOrder() {
  IconOrder icons;
  RETURN_IF_ERROR(appendLayout(database_, icons));
  appendApps(registry_, icons);
  return icons.take();
}

}  // namespace appsync::device
