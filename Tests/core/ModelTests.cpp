// SPDX-License-Identifier: MIT
// Random steps of the portable base beside its plain models.
#include "TestSupport.h"

struct Program {
  size_t (*model)(Input& input);
  const char* name;
  size_t steps;
};

void PrintTo(const Program& program, std::ostream* out) { *out << program.name; }

class Models : public CoreTest, public testing::WithParamInterface<Program> {};

TEST_P(Models, AgreeAfterEachStep) {
  const auto& [model, name, enough] = GetParam();
  for (size_t steps = 0; steps < enough;) {
    std::vector<u8> bytes(1 + Below(4000));
    for (u8& byte : bytes) byte = static_cast<u8>(random());
    Input input(bytes.data(), bytes.size());
    steps += model(input);
    ASSERT_EQ(Element::live, 0);
  }
}

INSTANTIATE_TEST_SUITE_P(PortableBase, Models,
                         testing::Values(Program{ArrayModel, "Array", 200000},
                                         Program{StringModel, "String", 1000000}),
                         [](const auto& each) { return each.param.name; });
