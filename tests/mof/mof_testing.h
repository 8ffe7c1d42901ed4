/// What the MOF tests share: a repository from a text, and its faults as text.
#pragma once

#include "mof/Repository.h"

#include <gtest/gtest.h>

#include <memory>
#include <string>

namespace mof::testing {

/// A repository that read `text` under the name "t.mof" and was resolved, whatever came of it.
inline std::unique_ptr<Repository> read(const std::string& text)
{
    auto repository = std::make_unique<Repository>();
    repository->read_text("t.mof", text);
    repository->resolve();
    return repository;
}

/// The same for text that must be good.
inline std::unique_ptr<Repository> read_good(const std::string& text)
{
    auto repository = read(text);
    EXPECT_EQ(repository->fault_text(), "") << text;
    return repository;
}

/// The first fault of a text, as "line:column: reason"; "" for good text.
inline std::string fault(const std::string& text)
{
    const auto repository = read(text);
    if (repository->faults().empty()) return "";
    return repository->faults()[0].text().substr(std::string("t.mof:").size());
}

} // namespace mof::testing
