// The steps of a report: what the page shows and when. What is true is decided by the program; the page asks it.
"use strict";

(function () {
  var texts = JSON.parse(document.getElementById("texts").textContent);
  var steps = ["details", "issue", "reproduce", "send"];
  var emailPattern = /^[_a-z0-9-]+(\.[_a-z0-9-]+)*@[a-z0-9-]+(\.[a-z0-9-]+)*(\.[a-z]{2,4})$/;
  var outcomes = ["collect_failed", "collect_canceled", "compression_failed", "submission_failed"];
  var report = { name: "", email: "", issue: "", description: "", recorded: false };
  var recordingSince = 0;
  var clock = 0;

  function byId(id) { return document.getElementById(id); }

  function text(key, values) {
    var found = texts[key];
    if (found === undefined) {
      var answer = native.call("translate", key);
      found = answer.success ? answer.translation : texts.unknown;
    }
    return found.replace(/\{(\w+)\}/g, function (whole, name) {
      return values && name in values ? values[name] : whole;
    });
  }

  // --- Sections and messages

  function show(name) {
    var sections = document.querySelectorAll("main > section");
    for (var i = 0; i < sections.length; i++) sections[i].hidden = sections[i].id !== name;
    var place = steps.indexOf(name === "progress" || name === "success" || name === "failure" ? "send" : name);
    var items = byId("steps").children;
    for (var j = 0; j < items.length; j++) {
      if (j === place) items[j].setAttribute("aria-current", "step");
      else items[j].removeAttribute("aria-current");
      items[j].className = j < place ? "past" : "";
    }
    byId("position").textContent = text("step_position", { n: place + 1, count: steps.length });
    var title = byId(name + "-title");
    document.title = title.textContent + " - " + byId("product").textContent;
    byId("main").scrollTop = 0;
    title.focus();
  }

  function setMessage(id, key) {
    var place = byId(id);
    place.textContent = key ? text(key) : "";
    place.hidden = !key;
  }

  // Says at the field what is wrong with it; true when nothing is.
  function mark(field, errorId, isGood) {
    byId(errorId).hidden = isGood;
    if (isGood) field.removeAttribute("aria-invalid");
    else field.setAttribute("aria-invalid", "true");
    return isGood;
  }

  // Who mends a field need not look at its error any longer; whether it is good is asked again with the whole form.
  function forgive(event) {
    var field = event.target.closest("[aria-invalid]");
    if (field) mark(field, field.getAttribute("aria-describedby").split(" ").pop(), true);
  }

  // The first of these [field, is good] that is not good gets the focus.
  function focusFirstBad(checks) {
    for (var i = 0; i < checks.length; i++) {
      if (!checks[i][1]) {
        checks[i][0].focus();
        return false;
      }
    }
    return true;
  }

  // --- The steps

  function submitDetails(event) {
    event.preventDefault();
    var name = byId("name"), email = byId("email"), consent = byId("consent");
    setMessage("details-message", "");
    var checks = [
      [name, mark(name, "name-error", name.value.trim() !== "")],
      [email, mark(email, "email-error", emailPattern.test(email.value.trim()))],
      [consent, mark(consent, "consent-error", consent.checked)]
    ];
    if (!focusFirstBad(checks)) return;
    report.name = name.value.trim();
    report.email = email.value.trim();
    var answer = native.call("validate_user_details",
      { user_name: report.name, user_email: report.email, agreed_licence: consent.checked });
    if (answer.success) show("issue");
    else setMessage("details-message", "details_refused");
  }

  function submitIssue(event) {
    event.preventDefault();
    var chosen = document.querySelector("input[name=issue]:checked");
    var kind = byId("issue-kind"), description = byId("description");
    setMessage("issue-message", "");
    var checks = [
      [document.querySelector("input[name=issue]"), mark(kind, "issue-error", chosen !== null)],
      [description, mark(description, "description-error", description.value.trim() !== "")]
    ];
    if (!focusFirstBad(checks)) return;
    report.issue = chosen.value;
    report.description = description.value.trim();
    var answer = native.call("select_issue", { issue: report.issue, description: report.description });
    if (answer.success) show("reproduce");
    else setMessage("issue-message", "issue_refused");
  }

  function twoDigits(number) { return (number < 10 ? "0" : "") + number; }

  function showTime() {
    var seconds = Math.floor((Date.now() - recordingSince) / 1000);
    byId("timer").textContent = twoDigits(Math.floor(seconds / 60)) + ":" + twoDigits(seconds % 60);
  }

  function setRecording(isOn) {
    window.clearInterval(clock);
    recordingSince = isOn ? Date.now() : 0;
    if (isOn) clock = window.setInterval(showTime, 1000);
    if (isOn) showTime();
    byId("reproduce-toggle").textContent = text(isOn ? "reproduce_stop" : "reproduce_start");
    byId("reproduce-toggle").className = isOn ? "primary" : "";
    byId("reproduce-next").textContent = text(report.recorded ? "next" : "reproduce_skip");
    byId("reproduce-next").disabled = isOn;
    byId("reproduce-back").disabled = isOn;
    byId("reproduce-state").textContent = isOn ? text("reproduce_running") : report.recorded ? text("reproduce_done") : "";
  }

  function toggleRecording() {
    var button = byId("reproduce-toggle");
    var isStart = recordingSince === 0;
    button.disabled = true; // until the program has answered
    setMessage("reproduce-message", "");
    native.callAsync(isStart ? "start_issue_reproduction" : "stop_issue_reproduction", null, function (answer) {
      button.disabled = false;
      if (!answer.success) {
        setMessage("reproduce-message", isStart ? "reproduce_start_failed" : "reproduce_stop_failed");
        byId("reproduce-next").disabled = false; // sending switches it off too
      } else {
        report.recorded = report.recorded || !isStart;
        setRecording(isStart);
      }
      button.focus();
    });
  }

  function review() {
    byId("send-from").textContent = report.name + ", " + report.email;
    byId("send-issue").textContent = text("issue_" + report.issue);
    byId("send-description").textContent = report.description;
    byId("send-recorded").textContent = text(report.recorded ? "yes" : "no");
    setMessage("send-message", "");
    show("send");
  }

  function send() {
    var answer = native.call("submit", { issue_reproduced: report.recorded });
    if (!answer.success) {
      setMessage("send-message", "send_refused");
      return;
    }
    byId("cancel").disabled = false;
    showProgress(0);
    show("progress");
  }

  // --- The submission

  function showProgress(percent) {
    var stages = ["collect", "pack", "done"];
    var now = percent < 50 ? 0 : percent < 100 ? 1 : 2;
    byId("bar").value = percent;
    for (var i = 0; i < stages.length; i++) {
      var stage = document.querySelector("[data-stage=" + stages[i] + "]");
      stage.className = i < now ? "past" : i === now ? "now" : "";
      stage.querySelector(".state").textContent = i < now ? text("state_done") : i === now ? text("state_now") : "";
    }
    byId("progress-state").textContent = text("progress_state",
      { step: text("progress_" + stages[now]), percent: percent });
    if (now > 0) byId("cancel").disabled = true; // it is looked at while collecting only
  }

  function cancel() {
    byId("cancel").disabled = true;
    native.call("cancel");
    byId("progress-state").textContent = text("cancelling");
  }

  function succeed() {
    showProgress(100);
    byId("success-next").textContent = text("success_next", { email: report.email });
    show("success");
  }

  function fail(code) {
    var key = outcomes.indexOf(code) >= 0 ? code : "unknown";
    var state = native.call("get_state");
    byId("failure-text").textContent = text(key);
    byId("failure-help").textContent = text(key + "_help");
    var isUnsent = key === "submission_failed"; // the maker chooses whether such a package waits for the next run
    byId("failure-package").textContent =
      text(state.package ? "failure_package" : isUnsent ? "failure_unsent" : "failure_nothing");
    byId("failure-path").textContent = state.package || "";
    show("failure");
  }

  // Called by the program.
  window.on_api_notif = function (name, data) {
    if (name === "on_submit_progress") showProgress(Math.round(100 * data.step / data.steps));
    else if (name === "on_finished") succeed();
    else if (name === "on_error") fail(data);
  };

  // --- Wiring

  function onAll(selector, handler) {
    var elements = document.querySelectorAll(selector);
    for (var i = 0; i < elements.length; i++) elements[i].addEventListener("click", handler);
  }

  document.addEventListener("input", forgive);
  byId("details-form").addEventListener("submit", submitDetails);
  byId("issue-form").addEventListener("submit", submitIssue);
  onAll("#reproduce-toggle", toggleRecording);
  onAll("#reproduce-next", review);
  onAll("#send-button, #retry", send);
  onAll("#cancel", cancel);
  onAll("#minimize", function () { native.call("minimize"); });
  onAll("#close, [data-close]", function () { native.call("close"); });
  onAll("[data-go]", function (event) { show(event.currentTarget.getAttribute("data-go")); });

  byId("outside").hidden = native.isThere;
  var state = native.call("get_state");
  if (state.product_name) byId("product").textContent = state.product_name + " - " + text("app_title");
  show("details");
})();
