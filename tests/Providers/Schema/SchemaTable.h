#pragma once

#include <vector>

/// One class of the schema, as the DMTF's declarations and the rule of repetition make it; kept apart from
/// the bindings, so that a row missing or swapped there shows.
struct SchemaRow {
    const char* name;
    const char* superclass;  ///< empty for a root
    /// The members that the class itself has, in order, each `Name:Kind`, where the kind is what follows
    /// core::CimProperty, or > and the class for a reference. A leading + marks what its declaration holds
    /// (what it adds, newly makes a key of, or refers to anew), a trailing * a key. A last word ... stands
    /// for the members of the superclass that are not among them.
    const char* properties;
};

const std::vector<SchemaRow>& schemaTable();
